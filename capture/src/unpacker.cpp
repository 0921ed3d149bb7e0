// SPDX-License-Identifier: MIT
#include "unpacker.h"

#include <algorithm>
#include <new>

namespace netfloor {

namespace {

constexpr std::size_t inputOctets = std::size_t{64} * 1024;

} // namespace

Unpacker::Unpacker(std::span<const std::uint8_t> start) : input_(std::max(inputOctets, start.size())) {
    constexpr int gzipOnly = 16 + MAX_WBITS;
    if (inflateInit2(&inflate_, gzipOnly) != Z_OK) {
        throw std::bad_alloc();
    }
    std::copy(start.begin(), start.end(), input_.begin());
    inflate_.next_in = input_.data();
    inflate_.avail_in = static_cast<uInt>(start.size());
}

Unpacker::~Unpacker() {
    inflateEnd(&inflate_);
}

std::size_t Unpacker::read(OctetFile &file, std::span<std::uint8_t> octets) {
    inflate_.next_out = octets.data();
    inflate_.avail_out = static_cast<uInt>(octets.size());
    while (inflate_.avail_out == octets.size() && error_.empty()) {
        if (inflate_.avail_in == 0) {
            inflate_.next_in = input_.data();
            inflate_.avail_in = static_cast<uInt>(file.read(input_));
            if (inflate_.avail_in == 0) {
                if (!memberEnded_ && file.error().empty()) {
                    error_ = "the packed data end in the middle";
                }
                break;
            }
        }
        if (memberEnded_) { // another member follows
            inflateReset(&inflate_);
        }
        const int status = ::inflate(&inflate_, Z_NO_FLUSH);
        memberEnded_ = status == Z_STREAM_END;
        if (status != Z_OK && status != Z_STREAM_END && status != Z_BUF_ERROR) {
            error_ = "the packed data are damaged";
            if (inflate_.msg != nullptr) {
                error_ += std::string(" (") + inflate_.msg + ")";
            }
        }
    }
    return octets.size() - inflate_.avail_out;
}

} // namespace netfloor
