// SPDX-License-Identifier: MIT
#include "netfloor-capture/capture_writer.h"

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <limits>
#include <string>

#include "netfloor-capture/errors.h"
#include "pcapng_numbers.h"

namespace netfloor {
namespace {

constexpr std::size_t mostOptionOctets = 65535;

constexpr std::uint8_t mostDigits = 9;
// Seconds that 64 bits hold in nanoseconds. Times are counted from a multiple of it, which for all usual ones is 0.
constexpr std::int64_t secondsOfOffset = std::int64_t{1} << 33U;

[[noreturn]] void fail(const std::filesystem::path &path) {
    throw CaptureWriteError(path.string() + " cannot be written: " + std::strerror(errno) +
                            ". What is in it is good up to there.");
}

std::int64_t offsetOf(std::int64_t seconds) {
    const std::int64_t whole = seconds / secondsOfOffset;
    return (seconds % secondsOfOffset < 0 ? whole - 1 : whole) * secondsOfOffset;
}

template <typename Number>
std::string_view octetsOf(const Number &number) {
    return {reinterpret_cast<const char *>(&number), sizeof number};
}

} // namespace

CaptureWriter::CaptureWriter(const std::filesystem::path &path)
    : path_(path), file_(path, std::ios::binary | std::ios::trunc) {
    if (!file_) {
        throw CaptureWriteError(path_.string() + " cannot be created: " + std::strerror(errno) + '.');
    }
    constexpr std::uint16_t major = 1;
    constexpr std::uint16_t minor = 0;
    constexpr std::int64_t unknownLength = -1;
    startBlock(sectionHeader);
    add(byteOrderMagic);
    add(major);
    add(minor);
    add(unknownLength);
    endBlock();
}

void CaptureWriter::write(const CapturedPacket &packet) {
    time_ = packet.time.value_or(time_);
    const std::int64_t offset = offsetOf(time_.seconds);
    const std::uint8_t digits = packet.time ? std::min(packet.timeDigits, mostDigits) : mostDigits;
    wanted_.linkType = packet.linkType;
    wanted_.timeDigits = digits;
    wanted_.timeOffset = offset;
    wanted_.name.assign(packet.interfaceName);
    const std::uint32_t interface = numberOf(wanted_);
    std::uint64_t unitsPerSecond = 1;
    std::uint32_t nanosecondsPerUnit = 1'000'000'000;
    for (std::uint8_t digit = 0; digit < digits; ++digit) {
        unitsPerSecond *= 10;
        nanosecondsPerUnit /= 10;
    }
    const std::uint64_t units =
        static_cast<std::uint64_t>(time_.seconds - offset) * unitsPerSecond + time_.nanoseconds / nanosecondsPerUnit;
    startBlock(enhancedPacket);
    add(interface);
    add(static_cast<std::uint32_t>(units >> 32U));
    add(static_cast<std::uint32_t>(units));
    add(static_cast<std::uint32_t>(packet.octets.size()));
    add(packet.wireOctets);
    addPadded({reinterpret_cast<const char *>(packet.octets.data()), packet.octets.size()});
    for (const std::string_view comment : packet.comments) {
        addOption(commentOption, comment);
    }
    if (!packet.comments.empty()) {
        addOption(endOption, {});
    }
    endBlock();
}

void CaptureWriter::finish() {
    if (!file_.flush()) {
        fail(path_);
    }
}

std::uint32_t CaptureWriter::numberOf(const Interface &interface) {
    const auto [found, isNew] = interfaces_.try_emplace(interface, static_cast<std::uint32_t>(interfaces_.size()));
    if (isNew) {
        if (interface.linkType > std::numeric_limits<std::uint16_t>::max()) { // pcap has more bits for it
            throw CaptureWriteError(path_.string() + " cannot hold packets of link type " +
                                    std::to_string(interface.linkType) + ": pcapng numbers them up to 65535.");
        }
        constexpr std::uint16_t reserved = 0;
        constexpr std::uint32_t noSnapLength = 0;
        startBlock(interfaceDescription);
        add(static_cast<std::uint16_t>(interface.linkType));
        add(reserved);
        add(noSnapLength);
        if (!interface.name.empty()) {
            addOption(nameOption, interface.name);
        }
        addOption(timeResolutionOption, octetsOf(interface.timeDigits));
        if (interface.timeOffset != 0) {
            addOption(timeOffsetOption, octetsOf(interface.timeOffset));
        }
        addOption(endOption, {});
        endBlock();
    }
    return found->second;
}

void CaptureWriter::startBlock(std::uint32_t type) {
    block_.clear();
    add(type);
    add(std::uint32_t{0}); // the length, which endBlock knows
}

void CaptureWriter::endBlock() {
    const auto octets = static_cast<std::uint32_t>(block_.size() + sizeof(std::uint32_t));
    std::memcpy(block_.data() + sizeof(std::uint32_t), &octets, sizeof octets);
    add(octets);
    if (!file_.write(block_.data(), static_cast<std::streamsize>(block_.size()))) {
        fail(path_);
    }
}

void CaptureWriter::addOption(std::uint16_t code, std::string_view value) {
    value = value.substr(0, mostOptionOctets);
    add(code);
    add(static_cast<std::uint16_t>(value.size()));
    addPadded(value);
}

template <typename Number>
void CaptureWriter::add(Number number) {
    block_.append(octetsOf(number));
}

void CaptureWriter::addPadded(std::string_view octets) {
    constexpr std::size_t unit = 4;
    block_.append(octets);
    block_.append((unit - octets.size() % unit) % unit, '\0');
}

} // namespace netfloor
