// SPDX-License-Identifier: MIT
#include "octet_file.h"

#include <algorithm>
#include <cerrno>
#include <cstring>

#include <fcntl.h>
#include <poll.h>
#include <sys/stat.h>
#include <unistd.h>

#include "netfloor-capture/errors.h"

namespace netfloor {

namespace {

int openFile(const std::string &path) {
    const int file = ::open(path.c_str(), O_RDONLY | O_CLOEXEC);
    if (file < 0) {
        const int reason = errno;
        const bool isPattern = path.find_first_of("*?[") != std::string::npos;
        throw CaptureError(path + ": " + std::strerror(reason) + "." +
                           (reason != ENOENT ? " Check that you may read it."
                            : isPattern ? " The shell puts the files in the place of a pattern, unless none matches."
                                        : " Check the path; '-' reads from standard input."));
    }
    return file;
}

} // namespace

OctetFile::OctetFile(const std::string &path)
    : name_(path == "-" ? "standard input" : path), isOwn_(path != "-"), file_(isOwn_ ? openFile(path) : STDIN_FILENO) {
    try {
        checkKind();
    } catch (...) {
        if (isOwn_) {
            ::close(file_);
        }
        throw;
    }
}

OctetFile::~OctetFile() {
    if (isOwn_) {
        ::close(file_);
    }
}

void OctetFile::checkKind() {
    struct stat status = {};
    if (::fstat(file_, &status) == 0) {
        live_ = !S_ISREG(status.st_mode);
        size_ = live_ ? 0 : static_cast<std::uint64_t>(status.st_size);
        constexpr std::int64_t perSecond = 1'000'000'000;
        modified_ = std::int64_t{status.st_mtim.tv_sec} * perSecond + status.st_mtim.tv_nsec;
    }
    if (S_ISDIR(status.st_mode)) {
        throw CaptureError(name_ + " is a folder. Name the captures in it: netfloor " + name_ + "/*.pcap");
    }
    if (live_ && ::isatty(file_) == 1) {
        throw CaptureError(name_ + " is a terminal. Name a capture file, or send one: tcpdump -w - | netfloor -");
    }
}

std::size_t OctetFile::read(std::span<std::uint8_t> octets) {
    ssize_t got = -1;
    do {
        got = ::read(file_, octets.data(), octets.size());
    } while (got < 0 && errno == EINTR);
    if (got < 0) {
        error_ = std::strerror(errno);
        return 0;
    }
    position_ += static_cast<std::uint64_t>(got);
    return static_cast<std::size_t>(got);
}

void OctetFile::seek(std::uint64_t position) {
    if (::lseek(file_, static_cast<off_t>(position), SEEK_SET) < 0) {
        error_ = std::strerror(errno);
    }
    position_ = position;
}

bool OctetFile::isWaiting() const {
    pollfd watched = {file_, POLLIN, 0};
    return ::poll(&watched, 1, 0) == 0;
}

std::optional<double> OctetFile::progress() const {
    if (size_ == 0) {
        return std::nullopt;
    }
    return std::min(1.0, static_cast<double>(position_) / static_cast<double>(size_)); // the file may have grown
}

} // namespace netfloor
