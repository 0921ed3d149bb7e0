// SPDX-License-Identifier: MIT
// What a payload is that no layer decodes, in one line: the messages of GTP, and what an SCTP DATA chunk carries.
#pragma once

#include <array>
#include <cstdint>
#include <span>
#include <string_view>

namespace netfloor {

class PayloadLine {
public:
    // Of a UDP datagram, by its header, as far as both were captured. Both ports count.
    static PayloadLine ofUdp(std::span<const std::uint8_t> header, std::span<const std::uint8_t> payload);
    // Of a DATA chunk, by its payload protocol identifier.
    static PayloadLine ofSctp(std::uint32_t identifier, std::span<const std::uint8_t> payload);

    [[nodiscard]] bool isKnown() const { return !name_.empty(); }
    [[nodiscard]] std::string_view name() const { return name_; } // "GTP-U"
    // "GTP-U: G-PDU, 84 octets, TEID 0x1b2c"
    [[nodiscard]] std::string_view text() const { return {text_.data(), size_}; }

private:
    void gtp(std::span<const std::uint8_t> message, bool isUserPlane);
    void m3ua(std::span<const std::uint8_t> message);
    void start(std::string_view name);
    void append(std::string_view text) { size_ += text.copy(text_.data() + size_, text_.size() - size_); }
    void append(std::uint32_t number, int base = 10);

    std::string_view name_;
    std::array<char, 80> text_;
    std::size_t size_ = 0;
};

} // namespace netfloor
