// SPDX-License-Identifier: MIT
#include "capture/octet_stream.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstring>
#include <new>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>
#include <zlib.h>

namespace netfloor::cli {

namespace {

constexpr std::size_t bufferOctets = std::size_t{256} * 1024;

int openFile(const std::string &path) {
    if (path == "-") {
        return STDIN_FILENO;
    }
    const int file = ::open(path.c_str(), O_RDONLY | O_CLOEXEC);
    if (file < 0) {
        const int reason = errno;
        std::string sentence = path + ": " + std::strerror(reason) + ".";
        sentence +=
            reason == ENOENT ? " Check the path; '-' reads from standard input." : " Check that you may read it.";
        throw CaptureError(sentence);
    }
    return file;
}

} // namespace

// Unpacks gzip (RFC 1952). zlib's own file functions wait for a whole buffer, which a live capture may not fill
// for long.
class OctetStream::Unpacker {
public:
    explicit Unpacker(std::span<const std::uint8_t> start) : input_(bufferOctets) {
        constexpr int gzipOnly = 16 + MAX_WBITS;
        if (inflateInit2(&inflate_, gzipOnly) != Z_OK) {
            throw std::bad_alloc();
        }
        std::copy(start.begin(), start.end(), input_.begin());
        inflate_.next_in = input_.data();
        inflate_.avail_in = static_cast<uInt>(start.size());
    }
    ~Unpacker() { inflateEnd(&inflate_); }
    Unpacker(const Unpacker &) = delete;
    Unpacker &operator=(const Unpacker &) = delete;

    // Some octets, or none at the end of the stream, which is in order only behind a whole member.
    [[nodiscard]] std::size_t read(OctetStream &stream, std::span<std::uint8_t> octets) {
        inflate_.next_out = octets.data();
        inflate_.avail_out = static_cast<uInt>(octets.size());
        while (inflate_.avail_out == octets.size() && stream.error_.empty()) {
            if (inflate_.avail_in == 0) {
                inflate_.next_in = input_.data();
                inflate_.avail_in = static_cast<uInt>(stream.readFile(input_));
                if (inflate_.avail_in == 0) {
                    if (!memberEnded_ && stream.error_.empty()) {
                        stream.error_ = "the packed data end in the middle";
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
                stream.error_ = "the packed data are damaged";
                if (inflate_.msg != nullptr) {
                    stream.error_ += std::string(" (") + inflate_.msg + ")";
                }
            }
        }
        return octets.size() - inflate_.avail_out;
    }

private:
    z_stream inflate_ = {};
    std::vector<std::uint8_t> input_;
    bool memberEnded_ = false;
};

OctetStream::OctetStream(const std::string &path)
    : name_(path == "-" ? "standard input" : path), file_(openFile(path)), buffer_(bufferOctets) {
    struct stat status = {};
    if (::fstat(file_, &status) == 0) {
        live_ = !S_ISREG(status.st_mode);
        fileOctets_ = live_ ? 0 : static_cast<std::uint64_t>(status.st_size);
    }
    if (S_ISDIR(status.st_mode)) {
        ::close(file_);
        throw CaptureError(name_ + " is a folder. Name one capture file in it.");
    }
    if (live_ && ::isatty(file_) == 1) {
        throw CaptureError("standard input is a terminal. Name a capture file, or send one: tcpdump -w - | netfloor -");
    }
    constexpr std::array<std::uint8_t, 2> gzip = {0x1f, 0x8b};
    const auto start = peek(gzip.size());
    if (std::equal(start.begin(), start.end(), gzip.begin(), gzip.end())) {
        unpacker_ = std::make_unique<Unpacker>(std::span(buffer_).subspan(begin_, end_ - begin_));
        begin_ = end_ = 0;
    }
}

OctetStream::~OctetStream() {
    ::close(file_);
}

// What there is at once, so that a live source shows each packet as it comes.
std::size_t OctetStream::readFile(std::span<std::uint8_t> octets) {
    ssize_t got = -1;
    do {
        got = ::read(file_, octets.data(), octets.size());
    } while (got < 0 && errno == EINTR);
    if (got < 0) {
        error_ = std::strerror(errno);
        return 0;
    }
    filePosition_ += static_cast<std::uint64_t>(got);
    return static_cast<std::size_t>(got);
}

void OctetStream::fill(std::size_t count) {
    if (end_ - begin_ >= count) {
        return;
    }
    std::memmove(buffer_.data(), buffer_.data() + begin_, end_ - begin_);
    end_ -= begin_;
    begin_ = 0;
    while (end_ < count && error_.empty()) {
        const auto room = std::span(buffer_).subspan(end_);
        const std::size_t got = unpacker_ ? unpacker_->read(*this, room) : readFile(room);
        if (got == 0) {
            return;
        }
        end_ += got;
    }
}

std::span<const std::uint8_t> OctetStream::peek(std::size_t count) {
    count = std::min(count, buffer_.size());
    fill(count);
    return {buffer_.data() + begin_, std::min(count, end_ - begin_)};
}

std::size_t OctetStream::read(std::span<std::uint8_t> octets) {
    std::size_t done = 0;
    while (done < octets.size()) {
        const auto part = peek(std::min(octets.size() - done, buffer_.size()));
        if (part.empty()) {
            break;
        }
        std::memcpy(octets.data() + done, part.data(), part.size());
        begin_ += part.size();
        done += part.size();
    }
    position_ += done;
    return done;
}

std::optional<double> OctetStream::progress() const {
    if (fileOctets_ == 0) {
        return std::nullopt;
    }
    return static_cast<double>(filePosition_) / static_cast<double>(fileOctets_);
}

} // namespace netfloor::cli
