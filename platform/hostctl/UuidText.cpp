#include "UuidText.h"

#include <array>
#include <cstdint>
#include <cstring>

namespace HostCtlSim {

namespace {

// The value of each hexadecimal digit, 16 for any other character.
constexpr auto kHexValues = [] {
    std::array<uint8_t, 256> values{};
    for (auto& value : values) value = 16;
    for (int c = 0; c < 10; ++c) values[size_t('0' + c)] = uint8_t(c);
    for (int c = 0; c < 6; ++c) values[size_t('a' + c)] = values[size_t('A' + c)] = uint8_t(10 + c);
    return values;
}();

// The two digits of each byte value.
constexpr auto kHexPairs = [] {
    std::array<char, 512> pairs{};
    const char digits[] = "0123456789abcdef";
    for (size_t byte = 0; byte < 256; ++byte) {
        pairs[2 * byte] = digits[byte >> 4];
        pairs[2 * byte + 1] = digits[byte & 0xf];
    }
    return pairs;
}();

// Where each byte's two digits start in the text form.
constexpr size_t kDigitPositions[16] = {0, 2, 4, 6, 9, 11, 14, 16, 19, 21, 24, 26, 28, 30, 32, 34};

}  // namespace

bool ParseUuid(const char* text, size_t length, HostCtl::Mesk::Uuid& uuid) {
    if (length != 36 || text[8] != '-' || text[13] != '-' || text[18] != '-' || text[23] != '-') {
        return false;
    }
    unsigned invalid = 0;
    for (size_t byte = 0; byte < 16; ++byte) {
        unsigned high = kHexValues[static_cast<unsigned char>(text[kDigitPositions[byte]])];
        unsigned low = kHexValues[static_cast<unsigned char>(text[kDigitPositions[byte] + 1])];
        invalid |= high | low;
        uuid.bytes[byte] = static_cast<uint8_t>(high << 4 | low);
    }
    return invalid < 16;
}

void FormatUuid(const HostCtl::Mesk::Uuid& uuid, char* out) {
    for (size_t byte = 0; byte < 16; ++byte) {
        std::memcpy(out + kDigitPositions[byte], &kHexPairs[2 * size_t(uuid.bytes[byte])], 2);
    }
    out[8] = out[13] = out[18] = out[23] = '-';
    out[36] = '\0';
}

}  // namespace HostCtlSim
