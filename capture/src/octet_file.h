// SPDX-License-Identifier: MIT
// The octets of a file or of standard input, as they come.
//
// They are read and not mapped: a mapped file that another program shortens ends this one with a signal.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>
#include <string>

namespace netfloor {

class OctetFile {
public:
    // "-" is standard input. Throws CaptureError.
    explicit OctetFile(const std::string &path);
    ~OctetFile();
    OctetFile(const OctetFile &) = delete;
    OctetFile &operator=(const OctetFile &) = delete;

    // Reads what is available without waiting for more, so that a live source shows each packet as it comes; 0 at the
    // end.
    [[nodiscard]] std::size_t read(std::span<std::uint8_t> octets);

    // Whether `read` would wait for octets.
    [[nodiscard]] bool isWaiting() const;

    [[nodiscard]] const std::string &name() const { return name_; }
    [[nodiscard]] bool isLive() const { return live_; }
    [[nodiscard]] std::uint64_t size() const { return size_; }        // when it was opened; 0 for a live one
    [[nodiscard]] std::int64_t modified() const { return modified_; } // nanoseconds since 1970

    // What comes next from `read`. Only for a file that is not live.
    void seek(std::uint64_t position);
    [[nodiscard]] std::optional<double> progress() const;

    // Why reading failed, or empty.
    [[nodiscard]] const std::string &error() const { return error_; }

private:
    void checkKind();

    std::string name_;
    bool isOwn_; // false for standard input, which is the program's
    int file_;
    bool live_ = false;
    std::uint64_t size_ = 0; // 0 where it is not known
    std::int64_t modified_ = 0;
    std::uint64_t position_ = 0;
    std::string error_;
};

} // namespace netfloor
