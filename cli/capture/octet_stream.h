// SPDX-License-Identifier: MIT
// The octets of a capture file: plain or gzip, from a file or from standard input.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <optional>
#include <span>
#include <stdexcept>
#include <string>
#include <vector>

namespace netfloor::cli {

// The file cannot be used at all. what() is a sentence for the user: what is wrong and what to do.
class CaptureError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

class OctetStream {
public:
    // "-" is standard input. Throws CaptureError.
    explicit OctetStream(const std::string &path);
    ~OctetStream();
    OctetStream(const OctetStream &) = delete;
    OctetStream &operator=(const OctetStream &) = delete;

    // The next octets, which stay unread; fewer than `count` at the end of the stream.
    [[nodiscard]] std::span<const std::uint8_t> peek(std::size_t count);

    // Fills `octets`; fewer at the end of the stream.
    [[nodiscard]] std::size_t read(std::span<std::uint8_t> octets);

    [[nodiscard]] const std::string &name() const { return name_; }
    [[nodiscard]] std::uint64_t position() const { return position_; } // octets handed out, after unpacking

    // The share of the file that has been read, or none where its size is not known.
    [[nodiscard]] std::optional<double> progress() const;

    // Why the stream ended early, or empty: a packed file that is cut or damaged, a disk that fails.
    [[nodiscard]] const std::string &error() const { return error_; }

    // Whether the octets come from a program or a user as they are made.
    [[nodiscard]] bool isLive() const { return live_; }
    [[nodiscard]] bool isPacked() const { return unpacker_ != nullptr; }

private:
    class Unpacker;

    void fill(std::size_t count);
    [[nodiscard]] std::size_t readFile(std::span<std::uint8_t> octets);

    std::string name_;
    int file_;
    std::vector<std::uint8_t> buffer_;
    std::size_t begin_ = 0; // of what is unread in buffer_
    std::size_t end_ = 0;
    std::uint64_t position_ = 0;
    std::uint64_t fileOctets_ = 0; // 0 where it is not known
    std::uint64_t filePosition_ = 0;
    bool live_ = false;
    std::unique_ptr<Unpacker> unpacker_; // none for a plain file
    std::string error_;
};

} // namespace netfloor::cli
