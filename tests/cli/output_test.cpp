// SPDX-License-Identifier: MIT
// Texts of packets in the buffer before standard output, which are checked several characters at a time.
#include "output.h"

#include <cstddef>
#include <string>

#include <gtest/gtest.h>

namespace netfloor::cli {
namespace {

// One character at a time.
std::string shown(const std::string &text) {
    static constexpr char digits[] = "0123456789abcdef";
    std::string result;
    for (const char character : text) {
        const auto octet = static_cast<unsigned char>(character);
        if (octet >= 0x20 && octet < 0x7f) {
            result += character;
        } else {
            result += {'\\', 'x', digits[octet >> 4U], digits[octet & 0xfU]};
        }
    }
    return result;
}

TEST(UntrustedText, isShownByItsCharactersAtEachPlaceOfEachLength) {
    for (const std::size_t blanks : {0U, 32U, 33U}) {
        for (std::size_t size = 1; size <= 50; ++size) {
            for (std::size_t place = 0; place < size; ++place) {
                for (const char character : {'\0', '\x1f', ' ', '~', '\x7f', '\x80', '\xa0', '\xff'}) {
                    std::string text(size, '~');
                    text[place] = character;
                    Output out(false, false);
                    out.untrusted(text, blanks);
                    ASSERT_EQ(out.since(0), std::string(blanks, ' ') + shown(text)) << size << ", " << place;
                }
            }
        }
    }
}

TEST(UntrustedText, hasTheNumberOfEachOctet) {
    std::string all;
    for (int octet = 0; octet < 256; ++octet) {
        all += static_cast<char>(octet);
    }
    Output out(false, false);
    out.untrusted(all);
    EXPECT_EQ(out.since(0), shown(all));
}

TEST(UntrustedText, makesTheBufferGrow) {
    Output out(false, false);
    std::string expected;
    for (int i = 0; i < 20000; ++i) {
        out.untrusted("a text of usual length", 40);
        expected += std::string(40, ' ') + "a text of usual length";
    }
    EXPECT_EQ(out.since(0), expected);
}

} // namespace
} // namespace netfloor::cli
