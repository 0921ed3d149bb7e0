// SPDX-License-Identifier: MIT
#include "octet_stream.h"

#include <algorithm>
#include <array>
#include <cstring>
#include <new>

namespace netfloor {

namespace {

// Large enough that a packet's share of a system call is small, and small enough for the cache of one core.
constexpr std::size_t bufferOctets = std::size_t{256} * 1024;
constexpr std::size_t firstOctets = std::size_t{16} * 1024;

} // namespace

OctetStream::OctetStream(const std::string &path) : file_(path) {
    grow(bufferOctets);
    constexpr std::array<std::uint8_t, 2> gzip = {0x1f, 0x8b};
    const auto start = peek(gzip.size());
    if (std::equal(start.begin(), start.end(), gzip.begin(), gzip.end())) {
        unpacker_.emplace(std::span(buffer_.get() + begin_, end_ - begin_));
        begin_ = end_ = 0;
    }
}

const std::string &OctetStream::error() const {
    return unpacker_ && file_.error().empty() ? unpacker_->error() : file_.error();
}

// realloc() can move pages. A new buffer would need memory in addition to the old one.
void OctetStream::grow(std::size_t least) {
    auto *const larger = static_cast<std::uint8_t *>(std::realloc(buffer_.get(), least));
    if (larger == nullptr) {
        throw std::bad_alloc();
    }
    (void)buffer_.release();
    buffer_.reset(larger);
    size_ = least;
}

// The buffer grows only as octets come, so that a damaged length cannot make it large.
std::size_t OctetStream::fill(std::size_t count) {
    std::memmove(buffer_.get(), buffer_.get() + begin_, end_ - begin_);
    end_ -= begin_;
    begin_ = 0;
    while (end_ < count) {
        if (end_ == size_) {
            grow(std::min(2 * size_, std::max(count, size_ + bufferOctets)));
        }
        std::span room(buffer_.get() + end_, size_ - end_);
        if (isFirst_) { // who wants a few packets does not wait for many
            room = room.first(std::min(room.size(), firstOctets));
            isFirst_ = false;
        }
        const std::size_t got = unpacker_ ? unpacker_->read(file_, room) : file_.read(room);
        if (got == 0) {
            return end_;
        }
        end_ += got;
    }
    return count;
}

bool OctetStream::skip(std::size_t count) {
    while (count > 0) {
        const std::size_t part = peek(std::min(count, bufferOctets)).size();
        if (part == 0) {
            return false;
        }
        take(part);
        count -= part;
    }
    return true;
}

} // namespace netfloor
