#include "UuidText.h"

#include <array>
#include <cstdint>
#include <cstring>
#include <type_traits>
#include <utility>

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

// Calls step(0) to step(15) one after the other, without a loop: a loop over the bytes cost
// more in its own bookkeeping than in converting them.
template <class Step, size_t... Byte>
void ForEachByte(Step&& step, std::index_sequence<Byte...>) {
    (step(std::integral_constant<size_t, Byte>()), ...);
}

}  // namespace

bool ParseUuid(const char* text, size_t length, HostCtl::Mesk::Uuid& uuid) {
    if (length != 36 || text[8] != '-' || text[13] != '-' || text[18] != '-' || text[23] != '-') {
        return false;
    }
    unsigned invalid = 0;
    ForEachByte(
        [&](size_t byte) {
            unsigned high = kHexValues[static_cast<unsigned char>(text[kDigitPositions[byte]])];
            unsigned low = kHexValues[static_cast<unsigned char>(text[kDigitPositions[byte] + 1])];
            invalid |= high | low;
            uuid.bytes[byte] = static_cast<uint8_t>(high << 4 | low);
        },
        std::make_index_sequence<16>());
    return invalid < 16;
}

void FormatUuid(const HostCtl::Mesk::Uuid& uuid, char* out) {
    ForEachByte(
        [&](size_t byte) {
            std::memcpy(out + kDigitPositions[byte], &kHexPairs[2 * size_t(uuid.bytes[byte])], 2);
        },
        std::make_index_sequence<16>());
    out[8] = out[13] = out[18] = out[23] = '-';
    out[36] = '\0';
}

}  // namespace HostCtlSim
