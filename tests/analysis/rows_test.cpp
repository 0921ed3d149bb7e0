// SPDX-License-Identifier: MIT
// The rows of a packet and their columns.
#include <map>
#include <string>

#include <gtest/gtest.h>

#include "netfloor-analysis/rows.h"
#include "netfloor-analysis/utf8.h"
#include "support/packets.h"

namespace netfloor::test {
namespace {

// A line for each row: "chunk chunk=1 octet=32 ...", without the columns that repeat those of the row around.
class Lines final : public RowSink {
public:
    void row(const Row &row) override {
        text += tableName(row.kind());
        bool isTimed = false;
        row.forEach([&](std::size_t place, const Value &value) {
            const Column &column = columns(row.kind())[place];
            isTimed |= column.name == "time";
            if (column.isRepeated) {
                return;
            }
            text.append(" ").append(column.name).append("=");
            switch (column.type) {
            case ColumnType::text: text += value.text; break;
            case ColumnType::address:
            case ColumnType::octets: text += hexText(value.octets); break;
            case ColumnType::time: text += std::to_string(value.time()); break;
            default: text += std::to_string(value.number); break;
            }
        });
        text += isTimed ? "\n" : " untimed\n";
    }

    std::string text;
};

// Of packets one after the other, by one object.
std::string rowsOf(const CapturedPacket &captured, int linkType = 228) {
    static Host host(PluginLibrary::open(NETFLOOR_PLUGIN));
    static PacketRows rows(host);
    Lines lines;
    const NetworkPart network = findNetworkPart(linkType, captured.octets);
    rows.read({captured, network, network.other.text()}, lines);
    return lines.text;
}

CapturedPacket captured(const Octets &octets) {
    CapturedPacket packet;
    packet.number = 7;
    packet.time = CaptureTime{-1, 999'999'999};
    packet.linkType = 228;
    packet.wireOctets = static_cast<std::uint32_t>(octets.size());
    packet.octets = octets;
    return packet;
}

constexpr CaptureTime outsideOfTime = {std::int64_t{1} << 40, 0}; // of what 64 bits of nanoseconds hold

TEST(Rows, areOfPacketLayersChunksAndCauses) {
    // ABORT with two causes, the second longer than the chunk; a cause of length 0; a DATA chunk after it.
    const Octets sctp = hex("0b59 0b5a 0000002a 00000000"
                            "06 00 0010  000d 0006 61*2 00*2  000b 00ff"
                            "09 00 0008  0001 0000"
                            "00 03 0014  00000001 0002 0003 00000004 63*4");
    const Octets packet = ipv4({.protocol = 132, .payload = sctp});
    const std::string text = rowsOf(captured(packet));
    const std::string_view wanted[] = {
        "packets packet=7 time=-1 interface.number=0 link_type=228 length=76 captured_length=76 ip_offset=0 "
        "ip_layers=1 "
        "checks.damaged=1 checks.damage=",
        "\nlayers layer=1 octet=0 source_port=2905 destination_port=2906 ip.version=4 ip.header_length=5 "
        "ip.total_length=76 ip.identification=4660 ip.dont_fragment=0 ip.more_fragments=0 ip.fragment_offset=0 "
        "ip.ttl=64 ip.protocol=132 ip.header_checksum=0 ip.source=0a 00 00 01 ip.destination=c0 a8 00 02 "
        "sctp.source_port=2905 sctp.destination_port=2906 sctp.verification_tag=42 sctp.checksum=0\n"
        "chunks chunk=1 octet=32 sctp.chunk_type=6",
        "\ncauses cause=1 octet=36 cause_code=13 cause_length=6 cause_value=61 61\n"
        "causes cause=2 octet=44 cause_code=11 cause_length=255 cause_value=\n"
        "chunks chunk=2 octet=48 sctp.chunk_type=9",
        "\ncauses cause=1 octet=52 cause_code=1 cause_length=0 cause_value=\n"
        "chunks chunk=3 octet=56 sctp.chunk_type=0 sctp.chunk_length=20 sctp.tsn=1 sctp.stream=2 "
        "sctp.stream_sequence_number=3 sctp.payload_protocol=4 sctp.unordered=0 sctp.begin_end=3\n",
    };
    for (const std::string_view part : wanted) {
        EXPECT_NE(text.find(part), std::string::npos) << part << "\nis not in\n" << text;
    }
    CapturedPacket untimed = captured(packet);
    untimed.time = outsideOfTime;
    EXPECT_NE(rowsOf(untimed).find(" cause_value=61 61 untimed\n"), std::string::npos) << "no time of a packet before";
}

TEST(Rows, tellHowPacketsCameIn) {
    const Octets inner = ipv4({.protocol = 6, .payload = hex("00 50 1f 90")}); // the rest of TCP was not captured
    const Octets gtp = hex("30 ff 0018 00000009") + inner;
    const Octets outer = ipv4({.protocol = 17, .payload = udp(2152, 2152, gtp)});
    const Octets nested = ipv4({.protocol = 4, .payload = outer});
    const std::string text = rowsOf(captured(nested));
    EXPECT_NE(text.find("layers layer=2 octet=20 tunnel=IP source_port=2152"), std::string::npos) << text;
    EXPECT_NE(text.find("layers layer=3 octet=56 tunnel=GTP-U tunnel_id=9 source_port=80 destination_port=8080"),
              std::string::npos)
        << text;
}

TEST(Rows, haveWhatThereIsWithoutIp) {
    const Octets arp = hex("ff*6 02*6 0806 00*28");
    CapturedPacket packet = captured(arp);
    packet.time = outsideOfTime;
    packet.interfaceNumber = 2;
    packet.interfaceName = "caf\xc3\xa9 \xff";
    packet.wireOctets = 60;
    EXPECT_EQ(rowsOf(packet, 1), "packets packet=7 interface.number=2 interface.name=caf\xc3\xa9 \xef\xbf\xbd "
                                 "link_type=228 length=60 captured_length=42 no_ip=ARP ip_layers=0 untimed\n");
    const Octets half = hex("60");
    EXPECT_NE(rowsOf(captured(half)).find(" note=no whole IP header "), std::string::npos);
}

TEST(Columns, holdTheirFields) {
    const std::map<ColumnType, std::uint32_t> mostBits = {
        {ColumnType::boolean, 1}, {ColumnType::u8, 8}, {ColumnType::u16, 16}, {ColumnType::u32, 32}};
    const FieldTables tables(PluginLibrary::open(NETFLOOR_PLUGIN));
    std::map<std::string_view, ColumnType> types;
    for (const RowKind kind : {RowKind::layer, RowKind::chunk}) {
        for (const Column &column : columns(kind)) {
            const auto [known, isNew] = types.try_emplace(column.name, column.type);
            EXPECT_EQ(known->second, column.type) << column.name << " has another type in " << tableName(kind);
        }
    }
    for (const LayerFieldSource &row : layerFieldSources()) {
        const ColumnType type = types.at(row.name);
        const bool isAddress = row.value == LayerValue::ipv4Address || row.value == LayerValue::ipv6Address;
        EXPECT_EQ(type == ColumnType::address, isAddress) << row.name;
        EXPECT_EQ(type == ColumnType::octets, row.value == LayerValue::octets) << row.name;
        for (const FieldDescription *field : tables.named(row.field.name)) {
            // The option is there: its number is no value.
            if (row.field.fits(*field) && mostBits.contains(type) && row.name != "tcp.sack_permitted") {
                EXPECT_TRUE(field->width && *field->width <= mostBits.at(type)) << row.name << " " << field->id;
            }
        }
    }
}

TEST(Utf8, replacesWhatIsNone) {
    const struct {
        std::string_view text;
        std::string_view wanted;
    } cases[] = {
        {"plain", "plain"},
        {{"a\0b", 3},
         "a\xef\xbf\xbd"
         "b"},
        {"\xc3\xa9\xe2\x82\xac\xf0\x9f\x98\x80", "\xc3\xa9\xe2\x82\xac\xf0\x9f\x98\x80"},
        {"\xc0\xaf", "\xef\xbf\xbd\xef\xbf\xbd"},                                 // longer than it needs to be
        {"\xed\xa0\x80", "\xef\xbf\xbd\xef\xbf\xbd\xef\xbf\xbd"},                 // half of a pair
        {"\xf4\x90\x80\x80", "\xef\xbf\xbd\xef\xbf\xbd\xef\xbf\xbd\xef\xbf\xbd"}, // above the last character
        {"\xe2\x82", "\xef\xbf\xbd\xef\xbf\xbd"},                                 // cut
    };
    for (const auto &[text, wanted] : cases) {
        std::string room;
        EXPECT_EQ(asUtf8(text, room), wanted);
    }
}

} // namespace
} // namespace netfloor::test
