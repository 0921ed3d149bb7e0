// SPDX-License-Identifier: MIT
// What can go wrong with a capture. what() is always a sentence for the user: what is wrong, where, and what to do.
#pragma once

#include <cstdint>
#include <stdexcept>
#include <string>

namespace netfloor {

// The file cannot be used at all.
class CaptureError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

// The file ends in the middle of a packet, or the next octets are no packet. All packets before are good.
class CaptureDamage : public std::runtime_error {
public:
    CaptureDamage(const std::string &sentence, std::uint64_t packetNumber, std::uint64_t position)
        : std::runtime_error(sentence), packetNumber_(packetNumber), position_(position) {}

    [[nodiscard]] std::uint64_t packetNumber() const { return packetNumber_; } // of the first packet that is lost
    [[nodiscard]] std::uint64_t position() const { return position_; }         // of the damaged record

private:
    std::uint64_t packetNumber_;
    std::uint64_t position_;
};

// A capture that is being written ends here.
class CaptureWriteError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

// A filter expression has no meaning, or there is no libpcap to compile it.
class FilterError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

} // namespace netfloor
