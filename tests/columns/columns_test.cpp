// SPDX-License-Identifier: MIT
// A capture as Arrow record batches, as a strict consumer reads them.
#include <array>
#include <stdexcept>
#include <thread>

#include <gtest/gtest.h>

#include "arrow_reader.h"
#include "netfloor-analysis/rows.h"
#include "netfloor-capture/capture_file.h"
#include "netfloor-columns/column_stream.h"
#include "netfloor-host/condition.h"
#include "netfloor-host/value_text.h"
#include "support/captures.h"
#include "support/packets.h"

namespace netfloor::test {
namespace {

ColumnScan scanOf(const std::string &path, RowKind table = RowKind::layer) {
    return {.path = path, .plugin = NETFLOOR_PLUGIN, .table = table};
}

TextTable read(const ColumnScan &scan) {
    ArrowArrayStream stream = {};
    openColumns(scan, stream);
    return readTable(stream);
}

std::string ownCapture(const std::string &name) {
    return std::string(NETFLOOR_CAPTURES) + "/" + name;
}

// What the columns should hold.
class TextRows final : public RowSink {
public:
    void row(const Row &row) override {
        TextRow texts(columns(row.kind()).size(), "-");
        row.forEach([&](std::size_t place, const Value &value) {
            texts[place] = text(columns(row.kind())[place].type, value);
        });
        tables[static_cast<std::size_t>(row.kind())].push_back(texts);
    }

    std::array<std::vector<TextRow>, rowKinds> tables;

private:
    static std::string text(ColumnType type, const Value &value) {
        switch (type) {
        case ColumnType::text: return std::string(value.text);
        case ColumnType::octets: return hexText(value.octets);
        case ColumnType::time: return std::to_string(value.time());
        case ColumnType::boolean: return value.number == 0 ? "0" : "1";
        case ColumnType::address: break;
        default: return std::to_string(value.number);
        }
        const std::span<const std::uint8_t> octets = value.octets;
        if (octets.size() == 4) {
            return ipv4Text(std::uint32_t{octets[0]} << 24U | std::uint32_t{octets[1]} << 16U |
                            std::uint32_t{octets[2]} << 8U | std::uint32_t{octets[3]});
        }
        Ipv6Octets address = {};
        std::ranges::copy(octets, address.begin());
        return ipv6Text(address);
    }
};

// Gives the error that ends the reading.
std::string readRows(const std::string &path, TextRows &texts) {
    Host host(PluginLibrary::open(NETFLOOR_PLUGIN));
    PacketRows rows(host);
    CaptureFile capture(path);
    CapturedPacket packet;
    try {
        while (capture.next(packet)) {
            const NetworkPart network = findNetworkPart(packet.linkType, packet.octets);
            rows.read({packet, network, network.other.text()}, texts);
        }
    } catch (const CaptureDamage &damage) {
        return damage.what();
    }
    return {};
}

TEST(Columns, haveTheRowsOfAllCaptures) {
    std::size_t rows = 0;
    for (const std::string &path : testCaptures()) {
        SCOPED_TRACE(path);
        TextRows wanted;
        const std::string error = readRows(path, wanted);
        for (std::size_t table = 0; table < rowKinds; ++table) {
            ColumnScan scan = scanOf(path, static_cast<RowKind>(table));
            scan.batchRows = 50; // ends of batches at many places
            const TextTable found = read(scan);
            EXPECT_EQ(found.error, error);
            const std::vector<TextRow> &wantedRows = wanted.tables[table];
            ASSERT_EQ(found.rows.size(), wantedRows.size()) << table;
            for (std::size_t row = 0; row < wantedRows.size(); ++row) {
                for (std::size_t column = 0; column < found.names.size(); ++column) {
                    ASSERT_EQ(found.rows[row][column], wantedRows[row][column]) << row << ' ' << found.names[column];
                }
            }
            rows += found.rows.size();
        }
    }
    EXPECT_GT(rows, 1000U);
}

TEST(Columns, haveTheTypesOfTheTable) {
    ColumnScan scan = scanOf(ownCapture("sctp-over-ipv6.pcap"));
    scan.columns = {"time", "ip_source", "ip.ttl", "tcp.syn", "quoted_data", "packet", "tunnel"};
    const TextTable text = read(scan);
    EXPECT_EQ(text.names, (TextRow{"time", "ip_source", "ip_ttl", "tcp_syn", "quoted_data", "packet", "tunnel"}));
    EXPECT_EQ(text.formats, (TextRow{"tsn:UTC", "i", "C", "b", "z", "L", "u"}));
    EXPECT_EQ(text.rows.at(0).at(1), "2001:db8::3:2:1");
    scan.binaryAddresses = true;
    const TextTable binary = read(scan);
    EXPECT_EQ(binary.formats.at(1), "z");
    EXPECT_EQ(binary.rows.at(0).at(1), "20 01 0d b8 00 00 00 00 00 00 00 03 00 02 00 01");

    ArrowSchema schema = {};
    columnSchema(scan, schema); // without the capture
    EXPECT_EQ(schema.n_children, 7);
    EXPECT_EQ(schema.children[0]->flags, ARROW_FLAG_NULLABLE);
    EXPECT_EQ(schema.children[5]->flags, 0);
    ArrowSchema taken = *schema.children[1]; // a child may outlive its parent
    schema.children[1]->release = nullptr;
    schema.release(&schema);
    EXPECT_STREQ(taken.name, "ip_source");
    taken.release(&taken);
}

TEST(Columns, ofABatchOutliveBatchAndStream) {
    ColumnScan scan = scanOf(ownCapture("sctp-over-ipv6.pcap"));
    scan.columns = {"ip.source", "ip.destination"};
    ArrowArrayStream stream = {};
    openColumns(scan, stream);
    ArrowSchema schema = {};
    ASSERT_EQ(stream.get_schema(&stream, &schema), 0);
    ArrowArray batch = {};
    ASSERT_EQ(stream.get_next(&stream, &batch), 0);
    stream.release(&stream);
    ArrowArray column = *batch.children[1];
    batch.children[1]->release = nullptr;
    batch.release(&batch);
    EXPECT_EQ(readColumn(*schema.children[1], column), TextRow{"2001:db8::3:2:2"});
    ArrowArray words = *column.dictionary;
    column.dictionary->release = nullptr;
    column.release(&column);
    words.release(&words);
    schema.release(&schema);
}

TEST(Columns, areOfRowsForWhichTheConditionHolds) {
    const Octets sctp = hex("0b59 0b5a 0000002a 00000000"
                            "00 03 0014  00000001 0002 0003 00000004 63*4"
                            " 00 03 0014  00000002 0002 0004 00000004 63*4");
    const std::string path =
        writeFile("where.pcap",
                  pcapFile(228, {{ipv4({.protocol = 132, .payload = sctp})}, {ipv4({.protocol = 6})}, {hex("00")}}));
    const auto count = [&](RowKind table, const std::string &where) {
        ColumnScan scan = scanOf(path, table);
        scan.where = where;
        return read(scan).rows.size();
    };
    EXPECT_EQ(count(RowKind::packet, ""), 3U);
    EXPECT_EQ(count(RowKind::packet, "sctp.tsn == 2"), 1U);
    EXPECT_EQ(count(RowKind::layer, "ip"), 2U);
    EXPECT_EQ(count(RowKind::layer, "not sctp"), 1U);
    EXPECT_EQ(count(RowKind::chunk, ""), 2U);
    EXPECT_EQ(count(RowKind::chunk, "sctp.tsn == 2 and ip.protocol == 132"), 1U);
    EXPECT_EQ(count(RowKind::chunk, "tcp"), 0U);
}

TEST(Columns, beforeADamageComeFirst) {
    Octets file = pcapFile(228, {{ipv4({})}, {ipv4({})}, {ipv4({})}});
    file.resize(file.size() - 3);
    const std::string path = writeFile("cut.pcap", file);
    const TextTable table = read(scanOf(path));
    EXPECT_EQ(table.batches, std::vector<std::size_t>{2});
    EXPECT_NE(table.error.find(path + ": the capture is cut off"), std::string::npos) << table.error;
    EXPECT_NE(table.error.find("in packet 3"), std::string::npos) << table.error;
}

TEST(Columns, refuseAScanWithoutMeaning) {
    const struct {
        void (*change)(ColumnScan &scan);
        const char *error;
    } rows[] = {
        {[](ColumnScan &scan) { scan.columns = {"sctp.tsn"}; }, "'sctp.tsn' is no column"},
        {[](ColumnScan &scan) {
             scan.columns = {"ip.ttl", "ip_ttl"};
         },
         "twice"},
        {[](ColumnScan &scan) { scan.where = "ip.tttl"; }, "ip.tttl"},
        {[](ColumnScan &scan) { scan.batchRows = 0; }, ""},
        {[](ColumnScan &scan) { scan.path += ".none"; }, ".none"},
        {[](ColumnScan &scan) { scan.plugin = NETFLOOR_STRANGER; }, NETFLOOR_STRANGER},
    };
    for (const auto &[change, error] : rows) {
        ColumnScan scan = scanOf(ownCapture("sctp-over-ipv6.pcap"));
        change(scan);
        ArrowArrayStream stream = {};
        try {
            openColumns(scan, stream);
            ADD_FAILURE() << error;
        } catch (const std::exception &thrown) {
            EXPECT_NE(std::string(thrown.what()).find(error), std::string::npos) << thrown.what();
        }
        EXPECT_EQ(stream.release, nullptr);
    }
}

// A batch of 64 Ki rows could hold more octets than 32-bit offsets reach.
TEST(Columns, ofManyOctetsEndABatch) {
    const Octets cause = hex("000b 03e8") + Octets(1000 - 4, 0x61);
    const Octets packet = ipv4({.protocol = 132, .payload = hex("0b59 0b5a 00*8 06 00 03ec") + cause});
    const std::string path = writeFile("octets.pcap", pcapFile(228, std::vector<PcapPacket>(25, {packet})));
    ColumnScan scan = scanOf(path, RowKind::cause);
    scan.columns = {"cause_value"};
    scan.batchOctets = 10000;
    EXPECT_EQ(read(scan).batches, (std::vector<std::size_t>{11, 11, 3}));
}

TEST(Columns, mayBeReadBySeveralThreads) {
    const auto readSome = [](std::size_t &rows) { rows = read(scanOf(ownCapture("sctp-over-ipv6.pcap"))).rows.size(); };
    std::array<std::size_t, 2> rows = {};
    std::thread other(readSome, std::ref(rows[0]));
    readSome(rows[1]);
    other.join();
    EXPECT_EQ(rows, (std::array<std::size_t, 2>{1, 1}));
}

} // namespace
} // namespace netfloor::test
