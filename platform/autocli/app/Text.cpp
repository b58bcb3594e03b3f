// Small text helpers shared by the parser, the help and the formatters.
#include "Text.h"

#include <locale.h>
#include <wchar.h>

#include <algorithm>
#include <cstdint>
#include <cstring>

namespace Kalmor {
namespace AutoCli {
namespace App {

namespace {

// Decodes one well-formed UTF-8 sequence at text[pos]: returns its length and stores the code
// point, or returns 0 for a malformed, overlong, surrogate or out-of-range sequence.
size_t DecodeOne(const std::string& text, size_t pos, char32_t& codePoint) {
    const auto byte = [&](size_t i) { return static_cast<unsigned char>(text[pos + i]); };
    unsigned char lead = byte(0);
    size_t length;
    char32_t minimum;
    if (lead < 0x80) {
        codePoint = lead;
        return 1;
    } else if (lead >= 0xC2 && lead <= 0xDF) {
        length = 2;
        minimum = 0x80;
        codePoint = lead & 0x1F;
    } else if (lead >= 0xE0 && lead <= 0xEF) {
        length = 3;
        minimum = 0x800;
        codePoint = lead & 0x0F;
    } else if (lead >= 0xF0 && lead <= 0xF4) {
        length = 4;
        minimum = 0x10000;
        codePoint = lead & 0x07;
    } else {
        return 0;
    }
    if (pos + length > text.size()) {
        return 0;
    }
    for (size_t i = 1; i < length; ++i) {
        if ((byte(i) & 0xC0) != 0x80) {
            return 0;
        }
        codePoint = (codePoint << 6) | (byte(i) & 0x3F);
    }
    if (codePoint < minimum || codePoint > 0x10FFFF ||
        (codePoint >= 0xD800 && codePoint <= 0xDFFF)) {
        return 0;
    }
    return length;
}

// The locale under which wcwidth measures characters: the built-in UTF-8 locale, whatever the
// user's own (the process's locale, and with it number formatting, stays "C").
locale_t WidthLocale() {
    static const locale_t locale = [] {
        locale_t found = newlocale(LC_CTYPE_MASK, "C.UTF-8", static_cast<locale_t>(nullptr));
        return found != static_cast<locale_t>(nullptr)
                   ? found
                   : newlocale(LC_CTYPE_MASK, "", static_cast<locale_t>(nullptr));
    }();
    return locale;
}

// Columns of one character: what wcwidth says, and one for what it cannot tell (unassigned
// characters, or no UTF-8 locale at all).
size_t CharWidth(char32_t codePoint) {
    const int width = wcwidth(static_cast<wchar_t>(codePoint));
    return width < 0 ? 1 : static_cast<size_t>(width);
}

bool AllowedInXml(char32_t c) {
    if (c < 0x20) {
        return c == 0x09 || c == 0x0A || c == 0x0D;
    }
    return c != 0xFFFE && c != 0xFFFF;
}

}  // namespace

std::string Trim(const std::string& text) {
    size_t begin = text.find_first_not_of(" \t");
    if (begin == std::string::npos) {
        return std::string();
    }
    size_t end = text.find_last_not_of(" \t");
    return text.substr(begin, end - begin + 1);
}

std::vector<std::string> SplitNames(const std::string& text) {
    std::vector<std::string> names;
    size_t start = 0;
    while (start <= text.size()) {
        size_t comma = text.find(',', start);
        if (comma == std::string::npos) {
            comma = text.size();
        }
        std::string name = Trim(text.substr(start, comma - start));
        if (!name.empty()) {
            names.push_back(name);
        }
        start = comma + 1;
    }
    return names;
}

std::string Join(const std::vector<std::string>& items, const std::string& separator) {
    std::string joined;
    for (size_t i = 0; i < items.size(); ++i) {
        if (i != 0) {
            joined += separator;
        }
        joined += items[i];
    }
    return joined;
}

namespace {

std::string Lower(const std::string& text) {
    std::string lower = text;
    for (char& c : lower) {
        c = static_cast<char>(c >= 'A' && c <= 'Z' ? c - 'A' + 'a' : c);
    }
    return lower;
}

// Edit distance with swaps of neighbours (optimal string alignment).
size_t EditDistance(const std::string& a, const std::string& b) {
    std::vector<std::vector<size_t>> d(a.size() + 1, std::vector<size_t>(b.size() + 1));
    for (size_t i = 0; i <= a.size(); ++i) d[i][0] = i;
    for (size_t j = 0; j <= b.size(); ++j) d[0][j] = j;
    for (size_t i = 1; i <= a.size(); ++i) {
        for (size_t j = 1; j <= b.size(); ++j) {
            size_t cost = a[i - 1] == b[j - 1] ? 0 : 1;
            d[i][j] = std::min({d[i - 1][j] + 1, d[i][j - 1] + 1, d[i - 1][j - 1] + cost});
            if (i > 1 && j > 1 && a[i - 1] == b[j - 2] && a[i - 2] == b[j - 1]) {
                d[i][j] = std::min(d[i][j], d[i - 2][j - 2] + 1);
            }
        }
    }
    return d[a.size()][b.size()];
}

}  // namespace

std::string DidYouMean(const std::string& word, const std::vector<std::string>& choices) {
    // Words of a command line are short; a long one is no typo of a name.
    if (word.empty() || word.size() > 64) {
        return std::string();
    }
    const std::string lower = Lower(word);
    const size_t allowed = lower.size() <= 4 ? 1 : 2;
    const std::string* best = nullptr;
    size_t bestDistance = allowed + 1;
    for (const auto& choice : choices) {
        size_t distance = EditDistance(lower, Lower(choice));
        if (distance < bestDistance) {
            best = &choice;
            bestDistance = distance;
        }
    }
    return best ? " (did you mean '" + *best + "'?)" : std::string();
}

size_t DisplayWidth(const std::string& text) {
    // Printable ASCII, by far the most common, is one column per byte without asking wcwidth.
    if (IsPlainText(text)) {
        return text.size();
    }
    size_t width = 0;
    size_t pos = 0;
    const locale_t locale = WidthLocale();
    const locale_t previous =
        locale != static_cast<locale_t>(nullptr) ? uselocale(locale) : static_cast<locale_t>(0);
    while (pos < text.size()) {
        char32_t codePoint;
        size_t length = DecodeOne(text, pos, codePoint);
        pos += length == 0 ? 1 : length;
        width += length == 0 ? 1 : CharWidth(codePoint);
    }
    if (previous != static_cast<locale_t>(0)) {
        uselocale(previous);
    }
    return width;
}

std::string ValidUtf8(const std::string& text, bool forXml) {
    static const char kReplacement[] = "\xEF\xBF\xBD";
    std::string clean;
    clean.reserve(text.size());
    size_t pos = 0;
    while (pos < text.size()) {
        char32_t codePoint;
        size_t length = DecodeOne(text, pos, codePoint);
        if (length == 0) {
            clean += kReplacement;
            ++pos;
            continue;
        }
        if (!forXml || AllowedInXml(codePoint)) {
            clean.append(text, pos, length);
        }
        pos += length;
    }
    return clean;
}

const std::string& ValidUtf8(const std::string& text, std::string& scratch, bool forXml) {
    if (IsPlainText(text)) {
        return text;
    }
    scratch = ValidUtf8(text, forXml);
    return scratch;
}

std::string MessageText(const std::string& text) {
    static const char kHex[] = "0123456789abcdef";
    std::string line;
    for (char c : ValidUtf8(text)) {
        const auto byte = static_cast<unsigned char>(c);
        if (c == '\n') {
            line += "\\n";
        } else if (c == '\r') {
            line += "\\r";
        } else if ((byte < 0x20 && c != '\t') || byte == 0x7F) {
            line += std::string("\\x") + kHex[byte >> 4] + kHex[byte & 0xF];
        } else {
            line += c;
        }
    }
    return line;
}

bool IsPlainText(const std::string& text) {
    // Eight bytes at a time: whether any is below 0x20 or above 0x7E.
    constexpr uint64_t kOnes = 0x0101010101010101;
    constexpr uint64_t kHighBits = 0x8080808080808080;
    const char* data = text.data();
    size_t size = text.size();
    for (; size >= 8; data += 8, size -= 8) {
        uint64_t word;
        std::memcpy(&word, data, 8);
        const uint64_t below = (word - kOnes * 0x20) & ~word;
        const uint64_t above = (word + kOnes * (127 - 0x7E)) | word;
        if (((below | above) & kHighBits) != 0) {
            return false;
        }
    }
    for (; size > 0; ++data, --size) {
        const auto byte = static_cast<unsigned char>(*data);
        if (byte < 0x20 || byte > 0x7E) {
            return false;
        }
    }
    return true;
}

void AppendScreenText(std::string& out, const std::string& text) {
    // Most texts hold nothing to escape: plain ASCII goes out as it is.
    if (IsPlainText(text)) {
        out += text;
        return;
    }
    static const char kHex[] = "0123456789abcdef";
    const auto hex = [&out](const char* prefix, char32_t value, int digits) {
        out += prefix;
        for (int shift = 4 * (digits - 1); shift >= 0; shift -= 4) {
            out += kHex[(value >> shift) & 0xF];
        }
    };
    size_t pos = 0;
    while (pos < text.size()) {
        char32_t codePoint;
        const size_t length = DecodeOne(text, pos, codePoint);
        const auto byte = static_cast<unsigned char>(text[pos]);
        if (length == 0) {
            // A stray byte: a terminal reading 8-bit controls would obey 0x80 to 0x9F.
            if (byte < 0xA0) {
                hex("\\x", byte, 2);
            } else {
                out += text[pos];
            }
            ++pos;
            continue;
        }
        if (codePoint == '\n') {
            out += "\\n";
        } else if (codePoint == '\r') {
            out += "\\r";
        } else if (codePoint == '\t') {
            out += "\\t";
        } else if (codePoint < 0x20 || codePoint == 0x7F) {
            hex("\\x", codePoint, 2);
        } else if (codePoint >= 0x80 && codePoint < 0xA0) {
            hex("\\u", codePoint, 4);
        } else {
            out.append(text, pos, length);
        }
        pos += length;
    }
}

std::string ScreenText(const std::string& text) {
    if (IsPlainText(text)) {
        return text;
    }
    std::string shown;
    AppendScreenText(shown, text);
    return shown;
}

std::string PadRight(const std::string& text, size_t width) {
    size_t current = DisplayWidth(text);
    return current >= width ? text : text + std::string(width - current, ' ');
}

}  // namespace App
}  // namespace AutoCli
}  // namespace Kalmor
