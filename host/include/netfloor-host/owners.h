// SPDX-License-Identifier: MIT
// Owners of next layers: what a host runs on the payload that a plug-in hands off.
#pragma once

#include <cstdint>
#include <functional>
#include <map>
#include <optional>
#include <span>
#include <string_view>
#include <utility>

#include <netfloor/records.h>

#include "netfloor-host/sink.h"

namespace netfloor {

class PacketRun;

// The next layer as its owner sees it. It lives during the owner's call.
class NextLayer {
public:
    [[nodiscard]] Pass pass() const;
    [[nodiscard]] std::uint32_t key() const;      // LayerFrame::nextLayerKey
    [[nodiscard]] std::uint32_t protocol() const; // LayerFrame::nextLayerProtocol, 0 where it was not written

    // The IP protocol that the payload came in: `protocol`, or the key where it holds a protocol number.
    // None for the port 3452, whose hand-off names no protocol.
    [[nodiscard]] std::optional<std::uint32_t> ipProtocol() const;

    [[nodiscard]] std::span<const std::uint8_t> packet() const;  // the whole packet; what was not captured is 0 or 0xff
    [[nodiscard]] std::span<const std::uint8_t> payload() const; // captured octets from the cursor to the limit
    [[nodiscard]] std::uint32_t bitsLeft() const;
    [[nodiscard]] std::uint32_t capturedBits() const; // of these

    [[nodiscard]] DecodeState &state();
    [[nodiscard]] PreDecodeContext *preDecodeContext(); // null in the XTR pass
    [[nodiscard]] XtrContext *xtrContext();             // null in the other passes

    // Moves the cursor over `bits` bits, or over all that are left if they are fewer.
    void consume(std::uint32_t bits);

    // Reports the next `bits` bits to the sink as one entry and consumes them: a field in MD, a text in TO. Bits that
    // were not captured are not reported.
    void take(std::uint32_t bits, std::string_view name, std::string_view longText, std::string_view shortText);

    // Opens and closes a record for the bits that `decode` consumes in the list of layers (MD and TO).
    void layer(std::uint32_t decoderId, const std::function<void()> &decode);

    // Runs the plug-in again: the same pass on the same state from the cursor on, its own hand-offs included.
    // False when that pass was cut off, or would be nested deeper than the host allows.
    [[nodiscard]] bool runPlugin();

private:
    friend class PacketRun;
    explicit NextLayer(PacketRun &run) : run_(run) {}

    PacketRun &run_;
};

enum class Handled : std::uint8_t {
    yes,
    refused, // hd_PreDecode gives a negative result, which cuts the pass off
};

// Decodes the next layer at the cursor. It need not take all bits. An exception ends the pass and reaches the
// caller of Host::run.
using Owner = std::function<Handled(NextLayer &)>;

// Takes all that is left as data.
[[nodiscard]] Handled takeAsData(NextLayer &next);

// Takes the user data of an SCTP DATA chunk (RFC 9260, 3.3.1) and the padding after it, so that the plug-in goes
// on with the next chunk. Takes all that is left where the octets before the cursor are no DATA chunk.
[[nodiscard]] Handled takeSctpUserData(NextLayer &next);

// Who owns which next layer.
class OwnerRegistry {
public:
    // takeSctpUserData for all of SCTP, takeAsData for the rest.
    OwnerRegistry();

    void add(std::uint32_t key, Owner owner);                         // this key with any protocol
    void add(std::uint32_t key, std::uint32_t protocol, Owner owner); // this key with this IP protocol
    void addProtocol(std::uint32_t protocol, Owner owner);            // any key of this IP protocol
    void setDefault(Owner owner);                                     // everything else

    // The owner: by key and protocol, else by key, else by protocol, else the default.
    [[nodiscard]] const Owner &find(std::uint32_t key, std::optional<std::uint32_t> protocol) const;

    // Nothing was added or set: the payload of TCP and UDP is data.
    [[nodiscard]] bool isUnchanged() const { return isUnchanged_; }

private:
    bool isUnchanged_ = true;
    std::map<std::pair<std::uint32_t, std::uint32_t>, Owner> byKeyAndProtocol_;
    std::map<std::uint32_t, Owner> byKey_;
    std::map<std::uint32_t, Owner> byProtocol_;
    Owner default_;
};

} // namespace netfloor
