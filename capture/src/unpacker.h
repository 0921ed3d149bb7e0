// SPDX-License-Identifier: MIT
// Unpacks gzip (RFC 1952). zlib's own file functions wait for a whole buffer, which a live capture may not fill for
// long.
#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <string>
#include <vector>

#include <zlib.h>

#include "octet_file.h"

namespace netfloor {

class Unpacker {
public:
    // `start`: the octets that were already read from the file.
    explicit Unpacker(std::span<const std::uint8_t> start);
    ~Unpacker();
    Unpacker(const Unpacker &) = delete;
    Unpacker &operator=(const Unpacker &) = delete;

    // Some octets, or none at the end. The end is an error unless a member of the file has just ended.
    [[nodiscard]] std::size_t read(OctetFile &file, std::span<std::uint8_t> octets);

    // Why the octets ended early, or empty.
    [[nodiscard]] const std::string &error() const { return error_; }

private:
    z_stream inflate_ = {};
    std::vector<std::uint8_t> input_;
    bool memberEnded_ = false;
    std::string error_;
};

} // namespace netfloor
