// Small text helpers shared by the parser, the help and the formatters.
#pragma once

#include <string>
#include <vector>

namespace Kalmor {
namespace AutoCli {
namespace App {

// The text without leading and trailing blanks and tabs.
std::string Trim(const std::string& text);

// Splits a comma-separated list, trims every name and drops empty ones, so that "A, B," is
// {"A", "B"}.
std::vector<std::string> SplitNames(const std::string& text);

std::string Join(const std::vector<std::string>& items, const std::string& separator);

// " (did you mean 'NAME'?)" for the choice closest to a mistyped word: one that differs only
// in case, or by at most one edit in a short word and two in a longer one (an edit inserts,
// deletes, replaces or swaps neighbouring letters); "" when no choice is that close.
std::string DidYouMean(const std::string& word, const std::vector<std::string>& choices);

// The number of characters of a UTF-8 text as a terminal shows them (one per code point;
// bytes that are not valid UTF-8 count one each).
size_t DisplayWidth(const std::string& text);

// The text with every invalid UTF-8 sequence replaced by U+FFFD. When `forXml` is set, also
// leaves out the characters that XML 1.0 forbids (control characters other than tab, line
// feed and carriage return, and U+FFFE and U+FFFF).
std::string ValidUtf8(const std::string& text, bool forXml = false);

// A text the user typed, made fit to stand in a one-line message: ValidUtf8, and every
// control character but tab written as an escape ("\n", "\r", "\x1b"), so that a value
// echoed in an error can neither break the message into lines nor drive the terminal.
std::string MessageText(const std::string& text);

// The text padded with blanks to `width` display characters.
std::string PadRight(const std::string& text, size_t width);

}  // namespace App
}  // namespace AutoCli
}  // namespace Kalmor
