// SPDX-License-Identifier: MIT
// The database, as a user of sqlite3 meets it.
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "cli/command.h"

using namespace netfloor::test;

namespace {

void checkSql(const std::vector<ExactCase> &cases) {
    for (const auto &[line, out] : cases) {
        checkExact({{"cd $T; sql() { sqlite3 \"$@\"; }; " + line, out}});
    }
}

TEST(Export, holdsWhatJsonHolds) {
    const Outcome made = shell("netfloor export --to $T/all.db $C/*.pcap*; netfloor json $C/*.pcap* >$T/all.json");
    EXPECT_EQ(made.exitCode, 0) << made.err;
    const Outcome counts =
        shell("sqlite3 $T/all.db 'SELECT (SELECT count(*) FROM packets), (SELECT count(*) FROM layers), "
              "(SELECT count(*) FROM chunks), (SELECT count(*) FROM causes)'\n"
              "jq -rs '[length, ([.[].layers[]] | length), ([.[].layers[].chunks[]] | length), "
              "([.[].layers[].chunks[].causes[]] | length)] | join(\"|\")' $T/all.json");
    const std::size_t half = counts.out.size() / 2;
    EXPECT_GT(half, 8U);
    EXPECT_EQ(counts.out.substr(0, half), counts.out.substr(half)) << counts.err;
    // Values of each type, null included.
    const Outcome layers =
        shell("sqlite3 -separator , $T/all.db \"SELECT packet, ip_source, ip_ttl, ifnull(tcp_syn, 'null'), "
              "ifnull(lower(hex(quoted_data)), 'null'), ifnull(tunnel, 'null') FROM layers\" >$T/a\n"
              "jq -r '.packet as $p | .layers[] | [$p, .ip.source // \"\", .ip.ttl // \"\", (.tcp.syn | if . == null "
              "then . else "
              "if . then 1 else 0 end end | tojson), .quoted.data // \"null\", .tunnel // \"null\"] | join(\",\")' "
              "$T/all.json >$T/b\n"
              "cmp $T/a $T/b && wc -l <$T/a");
    EXPECT_EQ(layers.err, "");
    EXPECT_GT(layers.out.size(), 3U);
    EXPECT_EQ(
        shell("sqlite3 $T/all.db 'PRAGMA integrity_check; PRAGMA foreign_key_check; SELECT count(*) FROM captures "
              "WHERE packets = 0'")
            .out,
        "ok\n0\n");
}

TEST(Export, givesViewsAndNames) {
    const Octets abort = hex("0b59 0b5a 0000002a 00000000  06 00 0010  0009 000c 61*8");
    const Octets data = hex("0b59 0b5a 0000002a 00000000  00 03 0014  00000001 0002 0003 00000004 63*4");
    const Octets inside = ipv4({.protocol = 17, .payload = udp(5000, 53), .source = 0x0a090909});
    const Octets gtp = hex("30 ff 001c 00000007") + inside;
    writeFile("views.pcap", pcapFile(228, {{ipv4({.protocol = 132, .payload = data})},
                                           {ipv4({.protocol = 132, .payload = abort})},
                                           {ipv4({.protocol = 132, .payload = data})},
                                           {ipv4({.protocol = 17, .payload = udp(2152, 2152, gtp)})}}));
    checkSql({
        {"netfloor export --to views.db views.pcap; sql views.db 'SELECT packet, ip_source, cause_code, cause_name, "
         "cause_value FROM aborts'",
         "2|10.0.0.1|9|No User Data|aaaaaaaa\n"},
        {"sql views.db 'SELECT sctp_tsn, times, first_packet, last_packet, nanoseconds FROM retransmissions'",
         "1|2|1|3|2000000000\n"},
        {"sql views.db 'SELECT tunnel, tunnel_id, outer_source, ip_source, destination_port FROM tunnels'",
         "GTP-U|7|10.0.0.1|10.9.9.9|53\n"},
        {"sql views.db 'SELECT ip_source, ip_destination, packets FROM flows WHERE ip_protocol = 132'",
         "10.0.0.1|192.168.0.2|3\n"},
    });
}

TEST(Export, keepsWhatIsThere) {
    checkSql({
        {"netfloor export --to kept.db $C/icmp-types.pcapng; netfloor export --to kept.db $C/icmp-types.pcapng; echo "
         "$?",
         "2\n"},
        {"netfloor export --append --to kept.db $C/tcp-md5-bgp.pcap; netfloor export --append --to new.db "
         "$C/tcp-md5-bgp.pcap; sql kept.db 'SELECT capture, count(*) FROM packets GROUP BY 1'; sql new.db 'SELECT "
         "count(*) "
         "FROM captures'",
         "1|15\n2|16\n1\n"},
        {"sql other.db 'CREATE TABLE packets(a)'; netfloor export --append --to other.db $C/icmp-types.pcapng; echo "
         "$?; "
         "netfloor export --append --to $C/README.md $C/icmp-types.pcapng; echo $?",
         "2\n6\n"},
        {"netfloor export --to absent/x.db $C/icmp-types.pcapng; echo $?", "6\n"},
        // A disk without room: nothing of the capture, and all of the one before.
        {"for i in 1 2 3 4 5 6 7 8; do echo $C/icmp6-mixed.pcap; done >list; cp kept.db full.db; trap '' XFSZ; "
         "(ulimit -f 120; netfloor export --append --to full.db $(cat list); echo $?); sql full.db 'PRAGMA "
         "integrity_check; SELECT count(*) FROM captures LEFT JOIN packets USING(capture) WHERE packet IS NULL'",
         "6\nok\n0\n"},
        // Killed in a second capture, which comes and does not end.
        {"(cat $C/tcp-md5-bgp.pcap; sleep 2) | $N export --append --to kept.db - & sleep 0.5; kill -9 $!; wait "
         "$!; "
         "sql kept.db 'PRAGMA integrity_check; SELECT count(*) FROM captures; SELECT count(*) FROM packets'",
         "ok\n2\n31\n"},
        {"(cat $C/tcp-md5-bgp.pcap; sleep 2) | $N export --to killed.db - & sleep 0.5; kill -9 $!; wait $!; "
         "netfloor export --append --to killed.db $C/icmp-types.pcapng; sql killed.db 'SELECT packets FROM captures'",
         "15\n"},
    });
}

// Of many blocks, with rows of all kinds, and an error in the middle of one.
TEST(Export, isTheSameWithAnyNumberOfJobs) {
    checkSql({
        {"netfloor --write once.pcapng $C/*.pcap* >out && netfloor --write many.pcapng once.pcapng{,,,} >out && "
         "{ cat many.pcapng; head -c 50 once.pcapng; } >cut.pcapng && for jobs in 1 2 5; do "
         "netfloor export --jobs $jobs --to $jobs.db many.pcapng once.pcapng cut.pcapng 2>$jobs.err; echo $?; done; "
         "netfloor export --append --to 5.db once.pcapng; netfloor export --append --jobs 1 --to 1.db once.pcapng; "
         "sql 1.db .dump >1.sql; sql 5.db .dump | cmp - 1.sql; cmp 1.err 2.err; cmp 1.err 5.err; "
         "sql 1.db 'SELECT count(*) > 10000, count(DISTINCT capture) FROM layers'",
         "4\n4\n4\n1|4\n"},
        {"sql 2.db \"CREATE TRIGGER no_more BEFORE INSERT ON packets WHEN new.packet = 3000 BEGIN SELECT RAISE(ABORT, "
         "'no more'); END\"; netfloor export --append --jobs 2 --to 2.db once.pcapng many.pcapng 2>2.err; echo $?; "
         "grep -c 'no more' 2.err; sql 2.db 'SELECT count(*), count(DISTINCT capture) FROM captures JOIN packets "
         "USING(capture)' >joined; sql 2.db 'SELECT sum(packets), count(*) FROM captures' | cmp - joined",
         "6\n1\n"},
    });
}

TEST(Export, tellsHowACaptureEnded) {
    checkSql({
        {"head -c 1000 $C/tcp-md5-bgp.pcap >cut.pcap; netfloor export --to cut.db cut.pcap $C/icmp-types.pcapng; echo "
         "$?; "
         "sql cut.db 'SELECT packets, problem IS NULL FROM captures'",
         "4\n8|0\n15|1\n"},
        {"(cat $C/tcp-md5-bgp.pcap; sleep 2) | $N export --to int.db - & sleep 0.5; kill $!; wait $!; echo "
         "$?; sql int.db 'SELECT packets, problem FROM captures'",
         "143\n16|interrupted after 16 packets.\n"},
        {"netfloor export --to where.db --where 'icmp.type == 5' $C/icmp-types.pcapng absent.pcap; echo $?; sql "
         "where.db "
         "'SELECT packets, file LIKE \"%icmp-types.pcapng\" FROM captures'",
         "3\n1|1\n"},
    });
}

} // namespace
