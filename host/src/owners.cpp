// SPDX-License-Identifier: MIT
#include "netfloor-host/owners.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <functional>

#include "data_owner.h"
#include "ip_numbers.h"
#include "octets.h"
#include "packet_run.h"
#include "payload_line.h"

namespace netfloor {
namespace {

constexpr std::uint32_t protocolNumbers = 256;
constexpr std::uint32_t hostsOwnDecoder = 0;

// "Data=12 octets", "Data - 3 octets and 4 bits". It allocates nothing.
class DataText {
public:
    DataText(std::string_view start, std::uint32_t bits) {
        const std::uint32_t octets = bits / bitsPerOctet;
        const std::uint32_t rest = bits % bitsPerOctet;
        append(start);
        append(octets);
        append(octets == 1 ? " octet" : " octets");
        if (rest != 0) {
            append(" and ");
            append(rest);
            append(" bits");
        }
    }

    [[nodiscard]] std::string_view view() const { return {text_.data(), size_}; }

private:
    void append(std::string_view text) { size_ += text.copy(text_.data() + size_, text_.size() - size_); }
    void append(std::uint32_t number) {
        size_ = static_cast<std::size_t>(std::to_chars(text_.data() + size_, text_.data() + text_.size(), number).ptr -
                                         text_.data());
    }

    std::array<char, 64> text_;
    std::size_t size_ = 0;
};

// As data, or as a payload that is known, in one piece.
void takeBits(NextLayer &next, std::uint32_t bits, const PayloadLine &known) {
    if (bits == 0) {
        return;
    }
    const std::uint32_t shown = std::min(bits, next.capturedBits());
    const std::string_view name = known.isKnown() ? known.name() : dataName;
    switch (next.pass()) {
    case Pass::md: next.take(shown, name, known.isKnown() ? known.text() : DataText("Data=", shown).view(), {}); break;
    case Pass::to:
        next.take(shown, name, {}, known.isKnown() ? known.text() : DataText("Data - ", shown).view());
        break;
    default: return next.consume(bits);
    }
    if (shown < bits) {
        next.take(bits - shown, name, {}, {});
    }
}

bool showsText(const NextLayer &next) {
    return next.pass() == Pass::md || next.pass() == Pass::to;
}

// The octets right before the payload; none where there are fewer.
std::span<const std::uint8_t> octetsBefore(NextLayer &next, std::size_t count) {
    const std::uint32_t bitsBefore = next.state().cursor - 1;
    const std::size_t first = bitsBefore / bitsPerOctet;
    if (bitsBefore % bitsPerOctet != 0 || first < count || first > next.packet().size()) {
        return {};
    }
    return next.packet().subspan(first - count, count);
}

// The user data of the DATA chunk whose head is the 16 octets before the payload.
struct UserData {
    std::uint32_t octets;
    std::uint32_t paddingOctets;
    std::uint32_t protocol; // its payload protocol identifier
};

std::optional<UserData> userDataAt(NextLayer &next) {
    constexpr std::uint32_t headOctets = 16;
    constexpr std::uint32_t lengthPlace = 2;
    constexpr std::uint32_t protocolPlace = 12;
    constexpr std::uint8_t dataChunk = 0;
    constexpr std::uint32_t chunkAlignment = 4;

    const auto head = octetsBefore(next, headOctets);
    if (head.empty()) {
        return std::nullopt;
    }
    const std::uint32_t length = be16(head, lengthPlace);
    if (head[0] != dataChunk || length < headOctets) {
        return std::nullopt;
    }
    return UserData{length - headOctets, (chunkAlignment - length % chunkAlignment) % chunkAlignment,
                    be32(head, protocolPlace)};
}

} // namespace

Pass NextLayer::pass() const {
    return run_.pass_;
}

std::uint32_t NextLayer::key() const {
    return run_.frame().nextLayerKey;
}

std::uint32_t NextLayer::protocol() const {
    return run_.frame().nextLayerProtocol;
}

std::optional<std::uint32_t> NextLayer::ipProtocol() const {
    if (protocol() != 0) {
        return protocol();
    }
    return key() < protocolNumbers ? std::optional(key()) : std::nullopt;
}

std::span<const std::uint8_t> NextLayer::packet() const {
    return run_.packet_;
}

std::span<const std::uint8_t> NextLayer::payload() const {
    const DecodeState &state = run_.state();
    const std::size_t first = (state.cursor - 1 + bitsPerOctet - 1) / bitsPerOctet;
    const std::size_t skippedBits = first * bitsPerOctet - (state.cursor - 1);
    if (first >= packet().size() || skippedBits > capturedBits()) {
        return {};
    }
    return packet().subspan(first, std::min(packet().size() - first, (capturedBits() - skippedBits) / bitsPerOctet));
}

std::uint32_t NextLayer::bitsLeft() const {
    return run_.state().bitsLeft;
}

std::uint32_t NextLayer::capturedBits() const {
    return run_.capturedBitsLeft();
}

DecodeState &NextLayer::state() {
    return run_.state();
}

PreDecodeContext *NextLayer::preDecodeContext() {
    return pass() == Pass::xtr ? nullptr : &run_.preDecode_.context;
}

XtrContext *NextLayer::xtrContext() {
    return pass() == Pass::xtr ? &run_.xtr_ : nullptr;
}

void NextLayer::consume(std::uint32_t bits) {
    const std::uint32_t consumed = std::min(bits, bitsLeft());
    state().cursor += consumed;
    state().bitsLeft -= consumed;
}

void NextLayer::take(std::uint32_t bits, std::string_view name, std::string_view longText, std::string_view shortText) {
    run_.addOwnEntry(std::min(bits, bitsLeft()), name, longText, shortText);
    consume(bits);
}

void NextLayer::layer(std::uint32_t decoderId, const std::function<void()> &decode) {
    const bool listed = pass() == Pass::md || pass() == Pass::to;
    if (listed) {
        run_.openLayer(decoderId);
    }
    decode();
    if (listed) {
        run_.closeLayer();
    }
}

bool NextLayer::runPlugin() {
    return run_.enterFromOwner();
}

Handled takeAsData(NextLayer &next) {
    const PayloadLine line = showsText(next) && next.ipProtocol() == protocolUdp
                                 ? PayloadLine::ofUdp(octetsBefore(next, udpOctets), next.payload())
                                 : PayloadLine();
    next.layer(hostsOwnDecoder, [&] { takeBits(next, next.bitsLeft(), line); });
    return Handled::yes;
}

Handled takeSctpUserData(NextLayer &next) {
    const std::optional<UserData> data = userDataAt(next);
    if (!data) {
        return takeAsData(next);
    }
    const std::uint32_t bits = std::min(data->octets * bitsPerOctet, next.bitsLeft());
    const auto payload = next.payload();
    const PayloadLine line =
        showsText(next)
            ? PayloadLine::ofSctp(data->protocol, payload.first(std::min<std::size_t>(payload.size(), data->octets)))
            : PayloadLine();
    const auto take = [&] {
        takeBits(next, bits, line);
        next.consume(data->paddingOctets * bitsPerOctet);
    };
    next.layer(hostsOwnDecoder, std::ref(take)); // a copy of its references would need the heap
    return Handled::yes;
}

OwnerRegistry::OwnerRegistry() : default_(takeAsData) {
    byProtocol_.emplace(protocolSctp, takeSctpUserData);
}

void OwnerRegistry::add(std::uint32_t key, Owner owner) {
    isUnchanged_ = false;
    byKey_.insert_or_assign(key, std::move(owner));
}

void OwnerRegistry::add(std::uint32_t key, std::uint32_t protocol, Owner owner) {
    isUnchanged_ = false;
    byKeyAndProtocol_.insert_or_assign({key, protocol}, std::move(owner));
}

void OwnerRegistry::addProtocol(std::uint32_t protocol, Owner owner) {
    isUnchanged_ = false;
    byProtocol_.insert_or_assign(protocol, std::move(owner));
}

void OwnerRegistry::setDefault(Owner owner) {
    isUnchanged_ = false;
    default_ = std::move(owner);
}

const Owner &OwnerRegistry::find(std::uint32_t key, std::optional<std::uint32_t> protocol) const {
    if (protocol) {
        if (const auto found = byKeyAndProtocol_.find({key, *protocol}); found != byKeyAndProtocol_.end()) {
            return found->second;
        }
    }
    if (const auto found = byKey_.find(key); found != byKey_.end()) {
        return found->second;
    }
    if (protocol) {
        if (const auto found = byProtocol_.find(*protocol); found != byProtocol_.end()) {
            return found->second;
        }
    }
    return default_;
}

} // namespace netfloor
