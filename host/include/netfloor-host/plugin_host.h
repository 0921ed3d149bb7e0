// SPDX-License-Identifier: MIT
// The host: runs the passes of a plug-in over packets. What they report goes to a sink, or comes back as a whole.
//
//     netfloor::Host host(netfloor::PluginLibrary::open("build/plugin/libnetfloor.so"));
//     const netfloor::Report report = host.run(netfloor::Pass::md, packet);
//     for (const netfloor::FieldReport& field : report.fields) {
//         std::cout << report.path(field) << ": " << field.text << '\n';
//     }
#pragma once

#include <cstdint>
#include <memory>
#include <span>

#include "netfloor-host/field_tables.h"
#include "netfloor-host/owners.h"
#include "netfloor-host/plugin_library.h"
#include "netfloor-host/reports.h"
#include "netfloor-host/sink.h"
#include "netfloor-host/value_text.h"
#include "netfloor-host/version.h"

namespace netfloor {

struct RunOptions {
    // What the packet had on the wire, from its IP header on, where a capture holds less of it; 0: all of it. The
    // passes run over a packet of that length, of at most 65,575 octets. A value that was not captured is not reported:
    // MD and TO end their reports before it, see Sink::notCaptured; MV has no flags that were raised after it; XTR has
    // no key that depends on it. The plug-in runs several times, and so do the owners.
    std::size_t wireOctets = 0;
    std::uint8_t layerNumber = 1;   // of the first layer
    std::uint32_t decoderId = 1;    // the host's word for the plug-in
    std::uint32_t mostNesting = 64; // how deep owners may nest calls of NextLayer::runPlugin
};

struct TestRunOptions; // testing.h

// A host keeps its storage from packet to packet. A packet that needs no more of it than an earlier one allocates
// nothing.
//
// A plug-in serves one packet at a time. `run` throws PluginBusy when another thread is running the same load of the
// plug-in: each thread needs a Host of its own with a PluginLibrary::openCopy. In one thread an owner of a next layer
// may run another packet, but a sink may not.
class FieldTables;

class Host {
public:
    explicit Host(PluginLibrary library);
    Host(Host &&other) noexcept;
    Host &operator=(Host &&other) noexcept;
    ~Host();

    [[nodiscard]] const PluginLibrary &library() const { return library_; }
    [[nodiscard]] PluginLibrary &library() { return library_; }
    [[nodiscard]] OwnerRegistry &owners() { return owners_; }
    // The fields of the plug-in, read with the first call. Throws PluginError.
    [[nodiscard]] const FieldTables &fieldTables();

    // Runs one pass over one packet, which starts with an IP header at its first octet, and reports to `sink`. Throws
    // PluginBusy, what an owner or the sink throws, and std::invalid_argument for a packet of half a GiB or more.
    Ending run(Pass pass, std::span<const std::uint8_t> packet, Sink &sink, const RunOptions &options = {});

    // The same; the report keeps everything.
    [[nodiscard]] Report run(Pass pass, std::span<const std::uint8_t> packet, const RunOptions &options = {});

    // The same in a state made for a test. Also throws std::invalid_argument for options that contradict the packet.
    Ending run(Pass pass, std::span<const std::uint8_t> packet, Sink &sink, const TestRunOptions &options);
    [[nodiscard]] Report run(Pass pass, std::span<const std::uint8_t> packet, const TestRunOptions &options);

private:
    class Runs;

    PluginLibrary library_;
    OwnerRegistry owners_;
    std::unique_ptr<Runs> runs_;
    std::unique_ptr<const FieldTables> fieldTables_;
};

} // namespace netfloor
