// SPDX-License-Identifier: MIT
// pcapng files (draft-ietf-opsawg-pcapng). libpcap does not read them here: it refuses a file whose interfaces differ
// in link type or snap length, as in captures on "any" and merged captures, even before the first packet.
#include <string_view>
#include <vector>

#include "interfaces.h"
#include "pcapng_numbers.h"
#include "records.h"

namespace netfloor {

namespace {

constexpr std::uint32_t frameOctets = 12; // type and length before a block's body, the length again after it
constexpr std::uint32_t mostBlockOctets = 2 * mostPacketOctets;
// Two kinds of blocks are read as a whole, and so must fit into the buffer: the description of an interface, and a
// packet with its comments.
constexpr std::uint32_t mostInterfaceOctets = std::uint32_t{1024} * 1024;
constexpr std::uint32_t mostOptionsOctets = std::uint32_t{1024} * 1024;

bool isPacket(std::uint32_t type) {
    return type == enhancedPacket || type == packetBlock || type == simplePacket;
}

struct Block {
    std::uint64_t position = 0;
    std::uint32_t type = 0;
    std::uint32_t octets = 0; // with type and lengths
};

class PcapngReader final : public RecordReader {
public:
    // A file that is damaged before its first packet is no capture, and refused at once.
    explicit PcapngReader(OctetStream &stream) : stream_(stream) {
        try {
            (void)findPacket();
        } catch (const CaptureDamage &damage) {
            throw CaptureError(damage.what());
        }
    }

    bool next(CapturedPacket &packet) override {
        if (!atPacket_ && !findPacket()) {
            return false;
        }
        takePacket(packet);
        atPacket_ = false;
        packet.number = ++number_;
        packet.position = block_.position;
        return true;
    }

    [[nodiscard]] ReadingPlace place() const override {
        return {stream_.position(), number_, section_.begin, interfaces_.count()};
    }
    [[nodiscard]] SectionBlocks section() const override { return section_; }

    void goTo(const ReadingPlace &place, const SectionBlocks &section) override {
        goToBlock(section.begin, sectionHeader);
        for (std::size_t i = 0; i < std::min<std::uint64_t>(place.interfaces, section.interfaces.size()); ++i) {
            goToBlock(section.interfaces[i], interfaceDescription);
            takeInterface();
        }
        interfaces_.setCount(place.interfaces);
        stream_.seek(place.position);
        number_ = place.packets;
        atPacket_ = false;
        oddBlocks_ = 0;
    }

    // A packet that is found already needs the rest of its own block alone.
    [[nodiscard]] bool isNextIn(std::span<const std::uint8_t> octets) const override {
        while (octets.size() >= 8) {
            const NumberView head(octets, bigEndian_);
            const std::size_t size = std::max(head.u32(4), frameOctets);
            if (octets.size() < size) {
                return false;
            }
            if (isPacket(head.u32(0))) {
                return true;
            }
            octets = octets.subspan(size);
        }
        return false;
    }

    [[nodiscard]] std::string note() const override {
        if (oddBlocks_ == 0) {
            return {};
        }
        return stream_.file().name() + ": the lengths of " + std::to_string(oddBlocks_) +
               " blocks are no multiple of four, the first at octet " + std::to_string(firstOddBlock_) +
               ". They were read all the same; a program that is strict about it will refuse the file.";
    }

private:
    [[nodiscard]] CaptureDamage damage(const std::string &reason) const {
        return damageAt(stream_, number_ + 1, block_.position, reason);
    }
    [[nodiscard]] CaptureDamage cut() const { return cutAt(stream_, number_ + 1, block_.position); }

    // Goes to the next block that is a packet. False at the end.
    bool findPacket() {
        while (readBlockHead()) {
            if (isPacket(block_.type)) {
                atPacket_ = true;
                return true;
            }
            if (block_.type == interfaceDescription) {
                takeInterface();
                continue;
            }
            if (!stream_.skip(block_.octets - 4)) {
                throw cut();
            }
            const auto octets = stream_.peek(4 + paddingOctets());
            stream_.take(secondLengthAt(octets) + 4);
        }
        return false;
    }

    void goToBlock(std::uint64_t position, std::uint32_t type) {
        stream_.seek(position);
        if (!readBlockHead() || block_.type != type) {
            throw damage("a block that is not what the plan says");
        }
    }

    // Peeks at the start of a block. False at the end.
    bool readBlockHead() {
        block_.position = stream_.position();
        const auto octets = stream_.peek(frameOctets);
        if (isPastShard(stream_, number_, octets.empty() && stream_.error().empty())) {
            return false;
        }
        if (octets.size() < frameOctets) {
            throw cut();
        }
        // The first word of a section header reads the same in both orders; the third shows the order.
        if (NumberView(octets, true).u32(0) == sectionHeader) {
            const std::uint32_t order = NumberView(octets, true).u32(8);
            if (order != byteOrderMagic && order != __builtin_bswap32(byteOrderMagic)) {
                throw damage("a section header without a byte order");
            }
            bigEndian_ = order == byteOrderMagic;
            interfaces_.clear();
            section_ = {.begin = block_.position, .interfaces = {}};
        }
        const NumberView head(octets, bigEndian_);
        block_.type = head.u32(0);
        block_.octets = head.u32(4);
        if (block_.octets < frameOctets || block_.octets > mostBlockOctets) {
            throw damage("a block of " + std::to_string(block_.octets) + " octets");
        }
        checkFits(stream_, number_, block_.octets);
        if (paddingOctets() != 0 && oddBlocks_++ == 0) {
            firstOddBlock_ = block_.position;
        }
        return true;
    }

    // What the block lacks to a multiple of four.
    [[nodiscard]] std::uint32_t paddingOctets() const { return -block_.octets % 4; }

    // Where the second length is in the octets from its usual place on. Of a block whose length is no multiple of
    // four, some programs write the padding and do not count it.
    [[nodiscard]] std::uint32_t secondLengthAt(std::span<const std::uint8_t> octets) const {
        if (octets.size() < 4) {
            throw cut();
        }
        for (const std::uint32_t at : {std::uint32_t{0}, paddingOctets()}) {
            if (octets.size() >= at + 4 && NumberView(octets, bigEndian_).u32(at) == block_.octets) {
                return at;
            }
        }
        throw damage("a block whose two lengths differ");
    }

    // The whole block, which is in the buffer then, without type and lengths.
    [[nodiscard]] std::span<const std::uint8_t> takeBlock() {
        const auto octets = stream_.peek(block_.octets + paddingOctets());
        if (octets.size() < block_.octets) {
            throw cut();
        }
        stream_.take(block_.octets + secondLengthAt(octets.subspan(block_.octets - 4)));
        return octets.subspan(8, block_.octets - frameOctets);
    }

    void takeInterface() {
        if (block_.octets < frameOctets + 8) {
            throw damage("an interface description that is too short");
        }
        if (block_.octets > mostInterfaceOctets) {
            throw damage("an interface description of " + std::to_string(block_.octets) + " octets");
        }
        interfaces_.add(readInterface({takeBlock(), bigEndian_}));
        if (section_.interfaces.size() < InterfaceTable::mostKept) {
            section_.interfaces.push_back(block_.position);
        }
    }

    [[nodiscard]] const Interface &interface(std::uint32_t number) const {
        const Interface *const found = interfaces_.find(number);
        if (found != nullptr) {
            return *found;
        }
        if (number < interfaces_.count()) {
            throw damage("interface " + std::to_string(number) + ", where " + std::to_string(InterfaceTable::mostKept) +
                         " is the limit,");
        }
        throw damage("an interface that is not described");
    }

    void takePacket(CapturedPacket &packet) {
        const std::size_t headOctets = block_.type == simplePacket ? 4 : 20;
        if (block_.octets < frameOctets + headOctets) {
            throw damage("a packet block that is too short");
        }
        const auto start = stream_.peek(8 + headOctets);
        if (start.size() < 8 + headOctets) {
            throw cut();
        }
        const NumberView head(start.subspan(8), bigEndian_);
        const bool isSimple = block_.type == simplePacket;
        const std::uint32_t number = isSimple ? 0 : block_.type == packetBlock ? head.u16(0) : head.u32(0);
        const Interface &from = interface(number);
        const auto room = static_cast<std::uint32_t>(block_.octets - frameOctets - headOctets);
        const std::uint32_t captured = isSimple ? simpleOctets(head.u32(0), from, room) : head.u32(12);
        checkLengths(captured, room, from);
        packet.time = isSimple ? std::nullopt : from.timeOf(std::uint64_t{head.u32(4)} << 32U | head.u32(8));
        packet.timeDigits = from.timeDigits();
        packet.interfaceNumber = number;
        packet.linkType = from.linkType;
        packet.wireOctets = head.u32(isSimple ? 0 : 16);
        packet.interfaceName = interfaces_.nameOf(number);
        const auto body = takeBlock();
        packet.octets = body.subspan(headOctets, captured);
        packet.comments = {};
        const std::size_t optionsAt = headOctets + captured + -captured % 4;
        if (!isSimple && optionsAt < body.size()) {
            findComments(body.subspan(optionsAt));
            packet.comments = comments_;
        }
    }

    void findComments(std::span<const std::uint8_t> options) {
        constexpr std::size_t mostComments = 64;
        comments_.clear();
        forEachOption({options, bigEndian_}, [&](std::uint16_t code, std::size_t at, std::size_t size) {
            if (code == commentOption && comments_.size() < mostComments) {
                comments_.emplace_back(reinterpret_cast<const char *>(options.data() + at), size);
            }
        });
    }

    // A simple packet block has the length on the wire, and not the captured length.
    static std::uint32_t simpleOctets(std::uint32_t onWire, const Interface &from, std::uint32_t room) {
        const std::uint32_t captured = std::min(onWire, room);
        return from.snapOctets == 0 ? captured : std::min(captured, from.snapOctets);
    }

    // Checked before the buffer has to hold the block.
    void checkLengths(std::uint32_t captured, std::uint32_t room, const Interface &from) const {
        if (captured > room) {
            throw damage("a packet larger than its block");
        }
        const std::uint32_t most = mostOctetsFor(from.snapOctets);
        if (captured > most) {
            throw damage("a length of " + std::to_string(captured) + " octets, where " + std::to_string(most) +
                         " is the limit,");
        }
        if (room - captured > mostOptionsOctets) {
            throw damage("a packet block with " + std::to_string(room - captured) + " octets of options");
        }
    }

    OctetStream &stream_;
    InterfaceTable interfaces_;              // of the section
    SectionBlocks section_;                  // where they are
    Block block_;                            // the one that is read
    std::vector<std::string_view> comments_; // of the packet
    std::uint64_t number_ = 0;
    std::uint64_t oddBlocks_ = 0; // whose length is no multiple of four
    std::uint64_t firstOddBlock_ = 0;
    bool bigEndian_ = false;
    bool atPacket_ = false; // the block is a packet, and not yet given out
};

} // namespace

std::unique_ptr<RecordReader> readPcapng(OctetStream &stream) {
    return std::make_unique<PcapngReader>(stream);
}

} // namespace netfloor
