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

// The number of columns a UTF-8 text takes on a terminal: wcwidth of each character under a
// UTF-8 locale (two for wide East Asian characters and most emoji, none for combining
// marks), one per byte that is not valid UTF-8.
size_t DisplayWidth(const std::string& text);

// The text with every invalid UTF-8 sequence replaced by U+FFFD. When `forXml` is set, also
// leaves out the characters that XML 1.0 forbids (control characters other than tab, line
// feed and carriage return, and U+FFFE and U+FFFF).
std::string ValidUtf8(const std::string& text, bool forXml = false);
// The same without a copy for printable ASCII, which it leaves as it is: returns `text`
// itself, or the cleaned text, which it keeps in `scratch`.
const std::string& ValidUtf8(const std::string& text, std::string& scratch, bool forXml = false);

// A text the user typed, made fit to stand in a one-line message: ValidUtf8, and every
// control character but tab written as an escape ("\n", "\r", "\x1b"), so that a value
// echoed in an error can neither break the message into lines nor drive the terminal.
std::string MessageText(const std::string& text);

// Host data made safe to show on a terminal: every control character (C0 including tab, DEL,
// C1) and every stray byte that a terminal could take for C1 is written as an escape ("\n",
// "\t", "\x1b", "\u009b", "\x9b"), so that no value can move the cursor, retitle the
// window or clear the screen. Other text, invalid UTF-8 included, is kept as it is.
std::string ScreenText(const std::string& text);
// ScreenText(text) appended to `out`.
void AppendScreenText(std::string& out, const std::string& text);
// Whether the text is printable ASCII only, which ScreenText leaves as it is.
bool IsPlainText(const std::string& text);

// The text padded with blanks to `width` display characters.
std::string PadRight(const std::string& text, size_t width);

}  // namespace App
}  // namespace AutoCli
}  // namespace Kalmor
