// SPDX-License-Identifier: MIT
// A file without a disk, for what reads or writes a path.
#pragma once

#include <array>
#include <cstdint>
#include <cstdlib>
#include <span>
#include <string>
#include <vector>

#include <sys/mman.h>
#include <unistd.h>

namespace netfloor::fuzz {

class MemoryFile {
public:
    MemoryFile()
        : file_(::memfd_create("netfloor-fuzz", MFD_CLOEXEC)), path_("/proc/self/fd/" + std::to_string(file_)) {
        if (file_ < 0) {
            std::abort();
        }
    }
    ~MemoryFile() { ::close(file_); }
    MemoryFile(const MemoryFile &) = delete;
    MemoryFile &operator=(const MemoryFile &) = delete;

    [[nodiscard]] int descriptor() const { return file_; }
    [[nodiscard]] const std::string &path() const { return path_; }

    void set(std::span<const std::uint8_t> octets) const {
        const bool done = ::ftruncate(file_, 0) == 0 &&
                          ::pwrite(file_, octets.data(), octets.size(), 0) == static_cast<ssize_t>(octets.size());
        if (!done) {
            std::abort();
        }
    }

    [[nodiscard]] std::string content() const {
        std::string text;
        std::array<char, 65536> part;
        while (true) {
            const ssize_t got = ::pread(file_, part.data(), part.size(), static_cast<off_t>(text.size()));
            if (got <= 0) {
                return text;
            }
            text.append(part.data(), static_cast<std::size_t>(got));
        }
    }

private:
    int file_;
    std::string path_;
};

} // namespace netfloor::fuzz
