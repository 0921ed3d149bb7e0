// SPDX-License-Identifier: MIT
#include "capture/octet_stream.h"

#include <algorithm>
#include <cerrno>
#include <cstring>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

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

OctetStream::OctetStream(const std::string &path)
    : name_(path == "-" ? "standard input" : path), file_(nullptr, gzclose_r), buffer_(bufferOctets) {
    const int file = openFile(path);
    struct stat status = {};
    if (::fstat(file, &status) == 0) {
        if (S_ISDIR(status.st_mode)) {
            ::close(file);
            throw CaptureError(name_ + " is a folder. Name one capture file in it.");
        }
        fileOctets_ = S_ISREG(status.st_mode) ? static_cast<std::uint64_t>(status.st_size) : 0;
        live_ = !S_ISREG(status.st_mode);
    }
    if (live_ && ::isatty(file) == 1) {
        throw CaptureError("standard input is a terminal. Name a capture file, or send one: tcpdump -w - | netfloor -");
    }
    file_.reset(gzdopen(file, "rb"));
    if (!file_) {
        throw CaptureError(name_ + ": there is not enough memory to read it.");
    }
    // gzread unpacks what starts like gzip and passes on everything else.
    gzbuffer(file_.get(), static_cast<unsigned>(live_ ? bufferOctets / 32 : bufferOctets));
    fill(1);
    packed_ = gzdirect(file_.get()) == 0;
}

void OctetStream::fill(std::size_t count) {
    if (end_ - begin_ >= count || !error_.empty()) {
        return;
    }
    std::memmove(buffer_.data(), buffer_.data() + begin_, end_ - begin_);
    end_ -= begin_;
    begin_ = 0;
    while (end_ < count) {
        // A live source must not wait for more than is asked for.
        const std::size_t wanted = live_ ? count - end_ : buffer_.size() - end_;
        const int got = gzread(file_.get(), buffer_.data() + end_, static_cast<unsigned>(wanted));
        if (got > 0) {
            end_ += static_cast<std::size_t>(got);
            continue;
        }
        // An error is told again, and counts, when all octets in front of it have been handed out.
        int status = Z_OK;
        const char *const text = gzerror(file_.get(), &status);
        if (status == Z_ERRNO) {
            error_ = std::strerror(errno);
        } else if (status == Z_BUF_ERROR) {
            error_ = "the packed data end in the middle";
        } else if (status != Z_OK && status != Z_STREAM_END) {
            error_ = std::string("the packed data are damaged (") + text + ")";
        }
        return;
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
    return static_cast<double>(gzoffset(file_.get())) / static_cast<double>(fileOctets_);
}

} // namespace netfloor::cli
