// SPDX-License-Identifier: MIT
#include "netfloor-host/plugin_host.h"

#include <utility>
#include <vector>

#include "netfloor-host/field_tables.h"
#include "packet_run.h"

namespace netfloor {

// The storage of the passes of a host. There is one run. There are more only where an owner of a next layer runs other
// packets on the same host.
class Host::Runs {
public:
    explicit Runs(const PluginLibrary &library) : plugin_(*library.loaded_), names_(plugin_.getTable) {}

    Ending run(Pass pass, std::span<const std::uint8_t> packet, const OwnerRegistry &owners, Sink &sink,
               const RunOptions &options, const TestRunOptions *test) {
        const PluginUse use(plugin_);
        const Turn turn(*this);
        return turn.packetRun().run(pass, packet, owners, sink, options, test);
    }

private:
    // Takes the next free run for a pass.
    class Turn {
    public:
        explicit Turn(Runs &runs) : runs_(runs) {
            if (runs_.active_ == runs_.runs_.size()) {
                runs_.runs_.push_back(std::make_unique<PacketRun>(runs_.plugin_, runs_.names_));
            }
            ++runs_.active_;
        }
        ~Turn() { --runs_.active_; }
        Turn(const Turn &) = delete;
        Turn &operator=(const Turn &) = delete;

        [[nodiscard]] PacketRun &packetRun() const { return *runs_.runs_[runs_.active_ - 1]; }

    private:
        Runs &runs_;
    };

    LoadedPlugin &plugin_;
    FieldNames names_;
    std::vector<std::unique_ptr<PacketRun>> runs_;
    std::size_t active_ = 0;
};

Host::Host(PluginLibrary library) : library_(std::move(library)), runs_(std::make_unique<Runs>(library_)) {}
Host::Host(Host &&other) noexcept = default;
Host &Host::operator=(Host &&other) noexcept = default;
Host::~Host() = default;

const FieldTables &Host::fieldTables() {
    if (!fieldTables_) {
        fieldTables_ = std::make_unique<const FieldTables>(library_);
    }
    return *fieldTables_;
}

Ending Host::run(Pass pass, std::span<const std::uint8_t> packet, Sink &sink, const RunOptions &options) {
    return runs_->run(pass, packet, owners_, sink, options, nullptr);
}

Ending Host::run(Pass pass, std::span<const std::uint8_t> packet, Sink &sink, const TestRunOptions &options) {
    return runs_->run(pass, packet, owners_, sink, options, &options);
}

Report Host::run(Pass pass, std::span<const std::uint8_t> packet, const RunOptions &options) {
    Report report;
    ReportSink keep(report);
    run(pass, packet, keep, options);
    return report;
}

Report Host::run(Pass pass, std::span<const std::uint8_t> packet, const TestRunOptions &options) {
    Report report;
    ReportSink keep(report);
    run(pass, packet, keep, options);
    return report;
}

} // namespace netfloor
