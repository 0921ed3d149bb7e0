// SPDX-License-Identifier: MIT
// The octets of a capture, unpacked. A reader peeks at them in a buffer, and takes them once it knows how many it
// needs.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <memory>
#include <optional>
#include <span>
#include <string>

#include "octet_file.h"
#include "unpacker.h"

namespace netfloor {

class OctetStream {
public:
    explicit OctetStream(const std::string &path);

    // The next octets, which stay unread; fewer than `count` at the end. Valid until the next call that reads.
    [[nodiscard]] std::span<const std::uint8_t> peek(std::size_t count) {
        if (end_ - begin_ < count) {
            count = fill(count);
        }
        return {buffer_.get() + begin_, count};
    }

    // Takes octets that a peek gave. They are valid until the next call that reads.
    void take(std::size_t count) {
        begin_ += count;
        position_ += count;
    }

    // What a peek gives without reading.
    [[nodiscard]] std::span<const std::uint8_t> unread() const { return {buffer_.get() + begin_, end_ - begin_}; }

    // Takes octets without a peek; false when the capture ends before.
    [[nodiscard]] bool skip(std::size_t count);

    // Goes on elsewhere in a file that is neither packed nor live.
    void seek(std::uint64_t position) {
        file_.seek(position);
        begin_ = end_ = 0;
        position_ = position;
    }

    [[nodiscard]] std::uint64_t position() const { return position_; } // octets taken
    // Where the capture ends, as far as it has been read.
    [[nodiscard]] std::uint64_t endPosition() const { return position_ + (end_ - begin_); }

    // Why the octets ended early, or empty: a packed file that is cut or damaged, a disk that fails.
    [[nodiscard]] const std::string &error() const;

    [[nodiscard]] const OctetFile &file() const { return file_; }
    [[nodiscard]] bool isPacked() const { return unpacker_.has_value(); }

private:
    struct Free {
        void operator()(std::uint8_t *octets) const { std::free(octets); }
    };

    [[nodiscard]] std::size_t fill(std::size_t count);
    void grow(std::size_t least);

    OctetFile file_;
    std::optional<Unpacker> unpacker_;
    std::unique_ptr<std::uint8_t, Free> buffer_;
    std::size_t size_ = 0;  // of buffer_
    std::size_t begin_ = 0; // of what is unread in buffer_
    std::size_t end_ = 0;
    std::uint64_t position_ = 0;
    bool isFirst_ = true; // nothing was read so far
};

} // namespace netfloor
