// SPDX-License-Identifier: MIT
// Packets one by one, with all their fields and texts.
#include <cstdint>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <tuple>
#include <utility>
#include <vector>

#include <nanobind/stl/optional.h>
#include <nanobind/stl/pair.h>
#include <nanobind/stl/string.h>
#include <nanobind/stl/vector.h>

#include "module.h"
#include "netfloor-analysis/utf8.h"
#include "netfloor-capture/capture_file.h"
#include "netfloor-capture/link_layer.h"
#include "netfloor-host/plugin_host.h"

namespace nb = nanobind;

namespace netfloor::python {
namespace {

std::string utf8(std::string_view text) {
    std::string room;
    return std::string(asUtf8(text, room));
}

struct Field {
    std::uint32_t id = 0;
    std::string name;
    std::string text;
    std::uint32_t value = 0;
    std::string path;
    std::vector<std::pair<std::uint32_t, std::uint32_t>> bits;
};

// A packet outlives the reader that gave it: it has its octets, and a share of the host.
class Packet {
public:
    Packet(std::shared_ptr<Host> host, const CapturedPacket &captured, const NetworkPart &network)
        : number(captured.number),
          time(captured.time ? captured.time->inNanoseconds() : std::nullopt),
          linkType(captured.linkType),
          length(captured.wireOctets),
          octets(captured.octets.begin(), captured.octets.end()),
          host_(std::move(host)),
          isIp_(network.isIp()),
          offset_(network.offset),
          networkOctets_(network.octets.size()),
          other_(network.other.text()) {}

    std::uint64_t number;
    std::optional<std::int64_t> time;
    int linkType;
    std::uint32_t length;
    std::vector<std::uint8_t> octets;

    [[nodiscard]] nb::bytes octetsObject() const { return nb::bytes(octets.data(), octets.size()); }
    [[nodiscard]] std::optional<std::size_t> ipOffset() const { return isIp_ ? std::optional(offset_) : std::nullopt; }
    [[nodiscard]] std::optional<std::string> noIp() const { return isIp_ ? std::nullopt : std::optional(other_); }

    [[nodiscard]] std::vector<Field> fields() const {
        std::vector<Field> fields;
        const Report report = run(Pass::md);
        for (const FieldReport &field : report.fields) {
            Field out = {field.id, utf8(field.name), utf8(field.text), field.value, utf8(report.path(field)), {}};
            out.name.erase(0, out.name.find_first_not_of(' '));
            for (const ReportedRange &range : field.ranges) {
                if (!out.bits.empty() && range.firstBit == out.bits.back().second + 1) {
                    out.bits.back().second = range.lastBit;
                } else {
                    out.bits.emplace_back(range.firstBit, range.lastBit);
                }
            }
            fields.push_back(std::move(out));
        }
        return fields;
    }

    [[nodiscard]] std::vector<std::string> texts() const {
        std::vector<std::string> texts;
        for (const DisplayReport &display : run(Pass::to).displays) {
            texts.push_back(utf8(display.text));
        }
        return texts;
    }

private:
    [[nodiscard]] Report run(Pass pass) const {
        if (!isIp_) {
            return {};
        }
        RunOptions options;
        options.wireOctets = octets.size() < length ? length - offset_ : 0;
        return host_->run(pass, std::span(octets).subspan(offset_, networkOctets_), options);
    }

    std::shared_ptr<Host> host_;
    bool isIp_;
    std::size_t offset_;
    std::size_t networkOctets_;
    std::string other_;
};

// One host for all packets of a plug-in: with the interpreter's lock held, one packet is decoded at a time.
std::shared_ptr<Host> sharedHost(const std::string &plugin) {
    static std::map<std::string, std::shared_ptr<Host>> hosts;
    std::shared_ptr<Host> &host = hosts[plugin];
    if (host == nullptr) {
        host = std::make_shared<Host>(PluginLibrary::openCopy(plugin));
    }
    return host;
}

class PacketReader {
public:
    PacketReader(const std::string &path, const std::string &plugin) : capture_(path), host_(sharedHost(plugin)) {}

    [[nodiscard]] Packet next() {
        CapturedPacket captured;
        if (!capture_.next(captured)) {
            throw nb::stop_iteration();
        }
        return {host_, captured, findNetworkPart(captured.linkType, captured.octets)};
    }

private:
    CaptureFile capture_;
    std::shared_ptr<Host> host_;
};

std::string fieldText(const Field &field) {
    return "<Field " + field.path + "/" + field.name + ": " + field.text + ">";
}

} // namespace

void addPackets(nb::module_ &module) {
    nb::class_<Field>(module, "Field")
        .def_ro("id", &Field::id)
        .def_ro("name", &Field::name)
        .def_ro("text", &Field::text)
        .def_ro("value", &Field::value)
        .def_ro("path", &Field::path)
        .def_ro("bits", &Field::bits)
        .def("__repr__", &fieldText);
    nb::class_<Packet>(module, "Packet")
        .def_ro("number", &Packet::number)
        .def_ro("time_ns", &Packet::time)
        .def_ro("link_type", &Packet::linkType)
        .def_ro("length", &Packet::length)
        .def_prop_ro("octets", &Packet::octetsObject)
        .def_prop_ro("ip_offset", &Packet::ipOffset)
        .def_prop_ro("no_ip", &Packet::noIp)
        .def("fields", &Packet::fields)
        .def("texts", &Packet::texts);
    nb::class_<PacketReader>(module, "PacketReader")
        .def(nb::init<const std::string &, const std::string &>(), nb::arg("path"), nb::arg("plugin"))
        .def("__iter__", [](nb::handle self) { return self; })
        .def("__next__", &PacketReader::next);
}

} // namespace netfloor::python
