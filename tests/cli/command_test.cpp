// SPDX-License-Identifier: MIT
// The command as a user meets it: what comes out on which side, and how it ends.
#include <algorithm>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "cli/command.h"

using namespace netfloor::test;

namespace {

const Octets udpPacket = ipv4({.protocol = 17, .payload = udp(40000, 53, hex("61*8"))});

struct Case {
    const char *line; // of the shell
    int exitCode;
    std::vector<std::string> out;    // each stands in the standard output; empty: there is none
    std::vector<std::string> err;    // likewise
    std::vector<std::string> not_in; // stands in neither
    long lines = -1;                 // of standard output, where it matters
};

void check(const std::vector<Case> &cases) {
    for (const Case &one : cases) {
        SCOPED_TRACE(one.line);
        const Outcome outcome = shell(one.line);
        EXPECT_EQ(outcome.exitCode, one.exitCode) << outcome.err;
        EXPECT_EQ(outcome.out.empty(), one.out.empty()) << outcome.out;
        EXPECT_EQ(outcome.err.empty(), one.err.empty()) << outcome.err;
        for (const std::string &text : one.out) {
            EXPECT_NE(outcome.out.find(text), std::string::npos) << "no '" << text << "' in:\n" << outcome.out;
        }
        for (const std::string &text : one.err) {
            EXPECT_NE(outcome.err.find(text), std::string::npos) << "no '" << text << "' in:\n" << outcome.err;
        }
        for (const std::string &text : one.not_in) {
            EXPECT_EQ((outcome.out + outcome.err).find(text), std::string::npos) << text;
        }
        if (one.lines >= 0) {
            EXPECT_EQ(std::count(outcome.out.begin(), outcome.out.end(), '\n'), one.lines) << outcome.out;
        }
    }
}

class Command : public testing::Test {
protected:
    static void SetUpTestSuite() {
        const Octets arp = hex("ff*6 02*6 0806 0001 0800 06 04 0001 02*6 0a000001 00*6 0a000002");
        const Octets lldp = hex("ff*6 02*6 88cc 00*46");
        const Octets ethernet = hex("ff*6 02*6 0800") + udpPacket;
        const Octets file = pcapFile(1, {{ethernet}, {arp}, {ethernet}, {lldp}, {arp}});
        writeFile("five.pcap", file);
        writeFile("inPacket.pcap", {file.begin(), file.begin() + 24 + 16 + 50 + 16 + 10});
        writeFile("inHead.pcap", {file.begin(), file.begin() + 24 + 16 + 50 + 7});
        writeFile("inFileHead.pcap", {file.begin(), file.begin() + 10});
        writeFile("headerOnly.pcap", {file.begin(), file.begin() + 24});
        writeFile("empty.pcap", {});
        writeFile("foreign.txt", hex("48*300"));
        writeFile("other.zst", hex("28b52ffd 00*20"));
        writeFile("cut.pcap", pcapFile(228, {{udpPacket}, {{udpPacket.begin(), udpPacket.begin() + 24}, 36}}));
        const Octets solicitation = hex("60000000 0020 3a ff fe80 00*13 01 ff02 00*13 02 8700 0000 00*4");
        writeFile("cutSolicitation.pcap", pcapFile(229, {{solicitation, 72}}));
        writeFile("withTail.pcap", file + hex("00*3"));
        const Outcome packed = shell("gzip -k $T/five.pcap && head -c -20 $T/five.pcap.gz > $T/half.pcap.gz");
        ASSERT_EQ(packed.exitCode, 0) << packed.err;
    }
};

TEST_F(Command, shows) {
    check({
        // One line a packet, and after them how many were no IP.
        {"netfloor $T/five.pcap",
         0,
         {" 10.0.0.1:40000 > 192.168.0.2:53 ", "no IP: ARP", "no IP: LLDP",
          "5 packets: 2 with IP, 3 without (2 ARP, 1 LLDP)"},
         {},
         {"\x1b"},
         6},
        {"netfloor $T/cutSolicitation.pcap", 0, {"neighbor solicitation  [cut by"}, {}, {"who has"}, 2},
        {"netfloor summary $T/cut.pcap", 0, {"[cut by the snap length: 24 of 36 octets]"}, {}, {"without"}, 2},
        {"netfloor --all $T/cut.pcap", 0, {"Normal Throughput"}, {}, {}, 2},
        {"netfloor --utc $T/five.pcap", 0, {"2001-09-09T01:46:40.000000Z"}, {}, {}, 6},
        {"netfloor --color always $T/five.pcap", 0, {"\x1b[2mno IP: ARP\x1b[0m"}, {}, {}},
        {"netfloor detail $T/five.pcap",
         0,
         {"Packet 2  1.000000  42 octets, Ethernet\n  no IP: ARP\n", "      Source Address= 10.0.0.1\n",
          "Destination Port=Domain Name Server (53)\n",
          "Data=8 octets\n            [handed on under key 53 of protocol 17]\n  [layer 1, octets 0 to 27]\n"
          "  [layer 2, octets 28 to 35]\n\n"},
         {},
         {"["
          "97-128]"}},
        {"netfloor --packet 1 detail --bits $T/five.pcap",
         0,
         {"Fragment Offset=0 octets  [49-53,57-64]\n"},
         {},
         {"ARP"}},
        {"netfloor detail $T/cut.pcap",
         0,
         {"UDP Destination Port=Domain Name Server (53)\n          [not captured: from 'UDP Length' on]\n",
          "  cut by the snap length: 24 of 36"},
         {},
         {}},
        {"netfloor verify $T/five.pcap",
         0,
         {"  good     good     IPv4: the header checksum is 0", "plug-in: 2 good\nchecks:  2 good\n", "3 without"},
         {},
         {"DAMAGED"},
         8},
        {"netfloor -r $T/five.pcap --packet 2-3,5", 0, {"no IP: ARP", "3 packets: 1 with IP"}, {}, {"LLDP"}, 4},
        {"netfloor help detail", 0, {"--bits"}, {}, {}},
        {"netfloor help", 0, {"Exit codes"}, {}, {}},
        {"netfloor verify --bad $T/five.pcap", 0, {"5 packets"}, {}, {"no IP: ARP"}, 3},
        {"netfloor keys --column ip.source --column udp.destination_port $T/five.pcap",
         0,
         {"packet,time,length,layer,tunnel,note,ip.source,udp.destination_port\n"
          "1,1000000000.000000000,50,1,,,10.0.0.1,53\n2,1000000001.000000000,42,,,no IP: ARP,,\n"},
         {},
         {},
         6},
        {"netfloor keys --raw --column ip.source $T/five.pcap", 0, {",0a000001\n"}, {}, {}, 6},
    });
}

TEST_F(Command, chooses) {
    check({
        {"netfloor --count 1 $T/five.pcap", 0, {"    1  "}, {}, {"ARP"}, 1},
        {"netfloor $T/five.pcap --filter arp -c 1", 0, {"    2  "}, {}, {"192.168"}, 2},
        {"netfloor -f 'udp dst port 53 and src host 10.0.0.1' $T/five.pcap", 0, {"    3  "}, {}, {"ARP"}, 2},
        {"netfloor -f 'udp port 1' $T/five.pcap", 0, {}, {}, {}, 0},
        {"netfloor --packet 9,3-2 $T/five.pcap", 2, {}, {"'9,3-2' is no list of packet numbers"}, {}},
        {"netfloor --packet 6 $T/five.pcap", 2, {}, {"has only 5 packets"}, {}},
        {"netfloor --packet 1 -f arp $T/five.pcap", 2, {}, {"does not match the filter"}, {}},
        {"netfloor -f 'no such' $T/five.pcap", 2, {}, {"pcap-filter"}, {}},
        {"netfloor --where 'ip.ttl <' $T/five.pcap", 2, {}, {"--where: ", "\n    ip.ttl <\n            ^"}, {}},
        {"netfloor --where $'ip.no\\e' $T/five.pcap", 2, {}, {"--where: ", "^"}, {"\x1b"}},
        {"mkdir -p $T/apart; cp $N $T/apart; LD_LIBRARY_PATH=$(dirname $N)/.. $T/apart/netfloor $T/five.pcap",
         5,
         {},
         {"the plug-in was not found at ", "--plugin PATH"},
         {}},
        {"netfloor keys --column Nothing $T/five.pcap", 2, {}, {"'Nothing'", "'ip.ttl' (Time to Live)"}, {}},
        {"netfloor --packet 0 $T/five.pcap", 2, {}, {"'0' is no list of packet numbers", "--help"}, {}},
        {"netfloor --count -1 $T/five.pcap", 2, {}, {"'-1' is no whole number"}, {}},
        {"netfloor --color blue $T/five.pcap", 2, {}, {"'blue' is none of auto, always and never"}, {}},
        {"netfloor detial $T/five.pcap", 2, {}, {"'detial' is neither a command nor a file"}, {}},
        {"netfloor detail", 2, {}, {"file is required"}, {}},
        {"netfloor --help", 0, {"Exit codes:"}, {}, {}},
    });
}

TEST_F(Command, readsAnyWay) {
    check({
        {"cat $T/five.pcap | netfloor -", 0, {"5 packets"}, {}, {}, 6},
        {"netfloor $T/five.pcap.gz", 0, {"5 packets"}, {}, {}, 6},
        {"netfloor - < $T/five.pcap.gz", 0, {"5 packets"}, {}, {}, 6},
        {"cat <(head -c 100 $T/five.pcap | gzip) <(tail -c +101 $T/five.pcap | gzip) | netfloor -",
         0,
         {"5 packets"},
         {},
         {},
         6},
        // A live source shows each packet as it comes.
        {"{ head -c 90 $T/five.pcap; sleep 5; } | netfloor - | { read -t 3 line; echo \"$line\"; }",
         0,
         {"10.0.0.1"},
         {},
         {},
         1},
    });
}

// Packet numbers are a file's; one that cannot be read does not keep the others from being read.
TEST_F(Command, readsSeveralFiles) {
    check({
        {"netfloor -c 1 $T/five.pcap $T/cut.pcap | sed \"s|$T/||\"",
         0,
         {"==> five.pcap <==\n    1  ", "\n\n==> cut.pcap <==\n    1  ",
          "\n\n==> all 2 captures <==\n2 packets: 2 with IP\n"},
         {},
         {},
         8},
        {"cd $T; netfloor keys --column ip.source five.pcap - < cut.pcap",
         0,
         {"file,packet,time", "\nfive.pcap,1,1000000000.000000000,50,1,,,10.0.0.1\n", "\nstandard input,2,"},
         {},
         {"==>"},
         8},
        {"netfloor verify --bad $T/five.pcap $C/tcp-urgent-loopback.pcap | tail -n 3",
         0,
         {"64 packets: 61 with IP, 3 without (2 ARP, 1 LLDP)\nplug-in: 2 good, 57 good with flags by design, 2 "
          "damaged\n"
          "checks:  54 good, 7 damaged\n"},
         {},
         {}},
        {"netfloor verify --bad $C/tcp-urgent-loopback.pcap $T/five.pcap", 1, {"all 2"}, {}, {}},
        {"netfloor $T/inPacket.pcap $T/missing.pcap $T/five.pcap",
         3,
         {"    1  ", "5 packets", "all 3"},
         {"cut off at octet 116", "No such file"},
         {"missing.pcap <=="}},
        {"netfloor $T/inPacket.pcap $T/five.pcap", 4, {"all 2"}, {"cut off at octet 116"}, {}},
        {"netfloor --packet 3 $T/five.pcap $T/cut.pcap", 2, {"    3  "}, {"has only 2 packets"}, {}},
        {"netfloor $T $T/five.pcap", 3, {"5 packets"}, {"is a folder. Name the captures in it"}, {}},
        {"netfloor \"$T/no*.pcap\" $T/five.pcap", 2, {}, {"neither a command nor a file"}, {}},
        {"netfloor summary \"$T/no*.pcap\"", 3, {}, {"unless none matches"}, {}},
        {"netfloor - - < $T/five.pcap", 2, {}, {"can be read once"}, {}},
        {"netfloor -f udp --write $T/both.pcapng $T/five.pcap $T/five.pcap > $T/out; netfloor $T/both.pcapng",
         0,
         {"    4  "},
         {},
         {},
         4},
        {"cd $T; netfloor --write five.pcap cut.pcap five.pcap", 2, {}, {"is a capture that is read"}, {}},
    });
}

TEST_F(Command, endsWithACodeAndASentence) {
    check({
        // Cut captures: all whole packets, then the place.
        {"netfloor $T/inPacket.pcap",
         4,
         {"    1  "},
         {"cut off at octet 116, in packet 2, which begins at octet 90 of the file; the 1 packet in front"},
         {},
         1},
        {"netfloor keys $T/inHead.pcap", 4, {"\n1,"}, {"at octet 97, in packet 2", "octet 90"}, {}, 2},
        {"netfloor $T/withTail.pcap", 4, {"5 packets"}, {"in packet 6"}, {}, 6},
        {"netfloor $T/half.pcap.gz", 4, {"    1  "}, {"packed data end in the middle", "of the unpacked capture"}, {}},
        {"cat $T/half.pcap.gz | netfloor -", 4, {"    1  "}, {"packed data end in the middle"}, {}},
        // Files that are no captures.
        {"netfloor $T/inFileHead.pcap", 3, {}, {"no usable capture header"}, {}},
        {"netfloor $T/missing.pcap", 3, {}, {"No such file", "Check the path"}, {}},
        {"netfloor $T/empty.pcap", 3, {}, {"is empty"}, {}},
        {"netfloor - < /dev/null", 3, {}, {"standard input is empty"}, {}},
        {"netfloor $T/foreign.txt", 3, {}, {"neither a pcap nor a pcapng", "editcap"}, {}},
        {"netfloor $T/other.zst", 3, {}, {"zstd -dc FILE | netfloor -"}, {}},
        {"netfloor $T", 3, {}, {"is a folder"}, {}},
        {"netfloor $T/headerOnly.pcap", 0, {}, {"holds no packets"}, {}},
        // The plug-in and the output.
        {"netfloor --plugin $T/none.so $T/five.pcap", 5, {}, {"none.so"}, {}},
        {"netfloor --plugin $T/foreign.txt $T/five.pcap", 5, {}, {"foreign.txt"}, {}},
        {"netfloor $T/five.pcap > /dev/full", 6, {}, {"No space left"}, {}},
        // Nobody foresaw a current folder that is gone.
        {"ln -s $P $T/link.so; mkdir $T/gone; cd $T/gone; rmdir $T/gone; netfloor --plugin ../link.so $T/five.pcap",
         7,
         {},
         {"a fault of netfloor itself", "Please report it"},
         {}},
        // The reader of a long output goes away.
        {"for i in 1 2 3 4 5 6; do netfloor detail $C/udp-tcp-rawip.pcap; done | head -n 1; exit ${PIPESTATUS[0]}",
         0,
         {"Packet 1"},
         {},
         {},
         1},
        {"netfloor detail $C/mixed-pppoe-double-vlan.pcap | head -n 1; exit ${PIPESTATUS[0]}",
         0,
         {"Packet 1"},
         {},
         {},
         1},
    });
}

#if !defined(__SANITIZE_ADDRESS__) // which takes more addresses than the limit gives
TEST_F(Command, tellsWhenMemoryRunsOut) {
    const Octets large = udpPacket + Octets(std::size_t{15} << 20U);
    writeFile("large.pcapng", pcapngSection() + pcapngInterface(228, {}) + pcapngPacket(0, 0, large));
    check({
        {"netfloor $T/large.pcapng", 0, {"10.0.0.1"}, {}, {}},
        // The libraries alone take more or less by the system: the limit goes up until the command starts.
        {"for kib in {8000..200000..4000}; do (ulimit -v $kib; netfloor $T/large.pcapng) >$T/out 2>$T/err; code=$?; "
         "case $code in 5 | 127) ;; *) break ;; esac; done; cat $T/err >&2; exit $code",
         8,
         {},
         {"memory ran out"},
         {}},
    });
}
#endif

// What is found out only when the output is written; and what must not reach a terminal.
TEST_F(Command, tellsWhatBecameOfItsAnswer) {
    check({
        {"netfloor --help > /dev/full", 6, {}, {"No space left"}, {}},
        {"netfloor --version >&-", 6, {}, {"standard output is closed"}, {}},
        {"netfloor $T/five.pcap >&-", 6, {}, {"standard output is closed"}, {}},
        {"netfloor --help | true; exit ${PIPESTATUS[0]}", 0, {}, {}, {}},
        {"netfloor $'bad\\e]0;name\\x9b\\xc2\\x9b'", 3, {}, {"bad\\x1b]0;name\\x9b\\xc2\\x9b:"}, {"\x1b"}},
        {"netfloor --plugin $'\\e.so' $T/five.pcap", 5, {}, {"\\x1b.so"}, {"\x1b"}},
        {"netfloor --count $'\\e' $T/five.pcap", 2, {}, {"'\\x1b'"}, {"\x1b"}},
        {"netfloor 'caf\xc3\xa9'", 3, {}, {"caf\xc3\xa9:"}, {}},
    });
}

// Ctrl-C: the totals of what was read, and then the end that the shell expects.
TEST_F(Command, endsWithTotalsWhenInterrupted) {
    const std::string start = "mkfifo $T/live; $N verify - < $T/live > $T/out & pid=$!; exec 3> $T/live; "
                              "cat $T/five.pcap ";
    const std::string end = " >&3; for i in {1..100}; do [ \"$(wc -l < $T/out)\" = 5 ] && break; sleep 0.05; done; "
                            "kill -TERM $pid; wait $pid; code=$?; cat $T/out; rm $T/live; exit $code";
    const std::string whole = start + end;
    const std::string inPacket = start + "<(head -c 7 $T/five.pcap)" + end;
    check({
        {whole.c_str(), 143, {"5 packets: 2 with IP", "checks:  2 good"}, {"interrupted after 5 packets"}, {"cut"}},
        {inPacket.c_str(), 143, {"5 packets: 2 with IP"}, {"interrupted after 5 packets"}, {"cut"}},
    });
}

// What every packet of a kind leaves by design is told apart from damage, and only damage makes the exit code.
TEST_F(Command, tellsFlagsByDesignFromDamage) {
    const Octets tcpHead = hex("0050 9c40 00000001 00000000");
    const Octets sctpHead = hex("0b59 0b59 00000000 00000000");
    const Octets init = sctpHead + hex("01 00 0014 00000001 00010000 000a 000a 00000001");
    Octets longInit = init;
    longInit[15] = 0x20; // the length says 12 octets more
    struct Row {
        Octets packet;
        std::uint32_t wireOctets;
        const char *verdict; // of the plug-in
        const char *expected;
        int exitCode; // with the verdict of the checks
    };
    const std::vector<Row> rows = {
        {udpPacket, 0, "good", "", 0},
        {ipv4({.protocol = 6, .payload = tcpHead + hex("5002 0100 0000 0000")}), 0, "good", "0x2 every TCP header", 0},
        {ipv4({.protocol = 6, .payload = tcpHead + hex("5002 0100 0000 0000 61*4")}), 0, "good", "at most 4 octets", 0},
        {ipv4({.protocol = 17, .payload = udp(1, 2, hex("61*4"))}), 0, "good", "0x10 a UDP payload", 0},
        {ipv4({.protocol = 47, .payload = hex("0000 0800 45*20")}), 0, "good", "0x2 every GRE payload", 1},
        {ipv4({.protocol = 132, .payload = init}), 0, "good", "0x8 an SCTP INIT", 0},
        {ipv4({.protocol = 17, .payload = hex("0001 0002 00")}), 0, "unread",
         "0x10 bits left over inside a length: 1 octet after 'UDP Destination Port' at octet 23 (User "
         "Datagram Protocol)",
         1},
        {ipv4({.protocol = 6, .payload = tcpHead + hex("f002 0100 0000 0000")}), 0, "DAMAGED", "0x2 every TCP header",
         1},
        {ipv4({.protocol = 132, .payload = longInit}), 0, "DAMAGED", "0x8 length reaches past the bits left", 1},
        {ipv4({.protocol = 132, .payload = sctpHead + hex("09 00 000c 0003 0008 00000005")}), 0, "good",
         "0x8 a list of SCTP error causes", 0},
        {ipv4({.protocol = 132, .payload = sctpHead + hex("06 00 000c 0005 0008 00000005")}), 0, "good",
         "0x8 a list of SCTP error causes", 0},
        {ipv4({.protocol = 132, .payload = sctpHead + hex("06 00 000c 0003 0010 00000005")}), 0, "DAMAGED", "0x8", 1},
        {ipv4({.protocol = 132, .payload = sctpHead + hex("09 00 0010 0003 0008 00000005")}), 0, "DAMAGED", "0x8", 1},
        {ipv4({.protocol = 47, .payload = hex("0000")}), 0, "DAMAGED", "0x2 expectation not met: something is shorter",
         1},
        // The octets of the identification are read from the last one on, which is no gap in front of them.
        {ipv6({.nextHeader = 44, .payload = hex("3a 00 0001 00000007  87*9")}), 0, "unread",
         "8 octets after 'ICMP Message Type' at octet 48", 1},
        {ipv4({.protocol = 1, .payload = hex("08 01 0000 0001 0001")}), 0, "misread",
         "0x2 expectation not met after 'ICMP Message Type' at octet 20", 1},
        // The capture, not the sender, has cut the first.
        {ipv4({.protocol = 132, .payload = longInit}), 60, "cut", "0x8", 1},
        {shortened(udpPacket, 11), 0, "unread", "", 1},
    };
    for (const Row &row : rows) {
        SCOPED_TRACE(std::string(row.verdict) + " " + row.expected);
        writeFile("one.pcap", pcapFile(228, {{row.packet, row.wireOctets}}));
        const Outcome outcome = shell("netfloor verify --all $T/one.pcap");
        EXPECT_NE(outcome.out.find(row.expected), std::string::npos) << outcome.out;
        EXPECT_NE(outcome.out.find("  " + std::string(row.verdict) + " "), std::string::npos) << outcome.out;
        EXPECT_EQ(outcome.exitCode, row.exitCode) << outcome.out;
        EXPECT_EQ(outcome.err, "");
    }
}

// What the texts of the plug-in leave out, or what a terminal must not get.
TEST_F(Command, detailShowsNumbersOctetsAndGaps) {
    const Octets quoted = ipv4({.protocol = 17, .payload = hex("00350007 00080001")});
    writeFile("texts.pcap",
              pcapFile(228, {{ipv6({.nextHeader = 58, .payload = hex("87 00 0000 00*20")})},
                             {ipv4({.protocol = 1, .payload = hex("0b 00 0000 00000000") + quoted + hex("61*2")})},
                             {ipv4({.protocol = 1, .payload = hex("08 00 0000 0001 0001 1b 5b 41")})}}));
    check({
        {"netfloor detail --packet 1 $T/texts.pcap",
         0,
         {"Next Header=IPv6-ICMP  (58)\n", "ICMP Message Type=  (135)\n", "[in no field: octets 41 to 63]\n"},
         {},
         {"\n          Source IP Address  ("}},
        {"netfloor detail --all --packet 1 $T/texts.pcap", 0, {"\n          Source IP Address  (2001:db8::1)"}, {}, {}},
        {"netfloor detail --packet 2 $T/texts.pcap",
         0,
         {"64-bit Original Data Datagram: 8 octets\n              00 35 00 07 00 08 00 01\n",
          "[in no field: octets 56 to 57]\n"},
         {},
         {}},
        {"netfloor detail --packet 3 $T/texts.pcap", 0, {"Message Data=\\x1b\n", "Data=A\n"}, {}, {"\x1b"}},
        {"netfloor --all --packet 3 $T/texts.pcap", 0, {"\\x1b"}, {}, {"\x1b"}},
    });
}

TEST_F(Command, showsIpv6AddressesInTheirUsualForm) {
    writeFile("ipv6.pcap", pcapFile(229, {{ipv6({.nextHeader = 17, .payload = udp(40000, 53, hex("61*8"))})}}));
    check({
        {"netfloor detail $T/ipv6.pcap", 0, {"Source IP Address=210.d08b.0.0.0.0.0.10  (2001:db8::1)\n"}, {}, {}},
        {"netfloor keys --column ip.source $T/ipv6.pcap", 0, {",2001:db8::1\n"}, {}, {}, 2},
        {"netfloor keys --raw --column ip.source $T/ipv6.pcap", 0, {",20010db8000000000000000000000001\n"}, {}, {}, 2},
        {"netfloor $T/ipv6.pcap", 0, {"  UDP       [2001:db8::1]:40000 > [2001:db8::2]:53       len 8\n"}, {}, {}, 1},
    });
}

TEST_F(Command, findsIpBehindEachLinkLayer) {
    struct Link {
        std::uint32_t type;
        const char *header; // in front of the IP header
        const char *other;  // what it is if it is no IP
    };
    const std::vector<Link> links = {
        {1, "ff*6 02*6 0800", ""},
        {1, "ff*6 02*6 8100 0001 0800", ""},
        {1, "ff*6 02*6 88a8 0001 8100 0002 8100 0003 0800", ""},
        {1, "ff*6 02*6 8864 11 00 0001 0026 0021", ""},
        {1, "ff*6 02*6 8100 0001 8864 11 00 0001 0026 0021", ""},
        {1, "ff*6 02*6 002c aaaa03 000000 0800", ""}, // SNAP
        {1, "ff*6 02*6 8864 11 00 0001 0026 c021", "PPP LCP"},
        {1, "ff*6 02*6 8863", "PPPoE discovery"},
        {1, "ff*6 02*6 0026 4242 03", "spanning tree"},
        {1, "ff*6 02*6 0026 e0e0 03", "802.3 frame"},
        {1, "ff*6 02*6 1234", "EtherType 0x1234"},
        {113, "0000 0001 0006 02*6 0000 0800", ""},
        {113, "0000 0001 0006 02*6 0000 8100 0001 0800", ""},
        {113, "0000 0001 0006 02*6 0000 0806", "ARP"},
        {276, "0800 0000 00000001 0001 00 06 02*8", ""},
        {276, "88cc 0000 00000001 0001 00 06 02*8", "LLDP"},
        {101, "", ""},
        {12, "", ""},
        {14, "", ""},
        {228, "", ""},
        {229, "", ""},
        {0, "02000000", ""},
        {0, "00000002", ""},
        {0, "1e000000", ""},
        {0, "07000000", "address family 7"},
        {108, "00000002", ""},
        {108, "0000001c", ""},
        {9, "ff03 0021", ""},
        {9, "0021", ""},
        {9, "21", ""},
        {9, "ff03 8021", "PPP IPCP"},
        {50, "ff03 0021", ""},
        {50, "0f00 0800", ""},
        {50, "ff03 8057", "PPP IPv6CP"},
        {51, "11 00 0001 0026 0021", ""},
        {166, "00 03 0021", ""},
        {166, "01 03 c023", "PPP PAP"},
        {204, "00 ff03 0021", ""},
        {147, "", "link type"}, // a type for private use
    };
    for (const Link &link : links) {
        SCOPED_TRACE(std::to_string(link.type) + ": " + link.header);
        writeFile("link.pcap", pcapFile(link.type, {{hex(link.header) + udpPacket}}));
        const Outcome outcome = shell("netfloor $T/link.pcap");
        EXPECT_EQ(outcome.exitCode, 0);
        const std::string expected =
            *link.other == '\0' ? " 10.0.0.1:40000 > 192.168.0.2:53 " : std::string("no IP: ") + link.other;
        EXPECT_NE(outcome.out.find(expected), std::string::npos) << outcome.out << outcome.err;

        // Cut anywhere, the header is told to be cut, or what is there is decoded: nothing is read beyond.
        const Octets whole = hex(link.header);
        std::vector<PcapPacket> cuts;
        for (std::size_t size = 0; size <= whole.size(); ++size) {
            cuts.push_back({Octets(whole.begin(), whole.begin() + static_cast<std::ptrdiff_t>(size)), 100});
        }
        writeFile("cuts.pcap", pcapFile(link.type, cuts));
        const Outcome cut = shell("netfloor $T/cuts.pcap");
        EXPECT_EQ(cut.exitCode, 0);
        EXPECT_EQ(cut.err, "");
    }
}

TEST_F(Command, readsPcapngWithInterfacesOfDifferentTypes) {
    const Octets ethernet = hex("ff*6 02*6 0800") + udpPacket;
    // Interface 1 counts in nanoseconds from 100 s on, interface 2 in 2^-10 s.
    const Octets first = pcapngSection() + pcapngInterface(1, {}) +
                         pcapngInterface(228, hex("0009 0001 09 000000 000e 0008 0000000000000064 0000 0000")) +
                         pcapngInterface(101, hex("0009 0001 8a 000000 0000 0000"));
    const Octets packets = pcapngPacket(0, 5'000'000, ethernet) + pcapngPacket(1, 2'500'000'000, udpPacket) +
                           pcapngBlock(5, hex("00*8")) + // statistics
                           pcapngPacket(2, 5 * 1024 + 512, udpPacket) +
                           pcapngBlock(3, be32(50) + ethernet); // a packet without a time
    // The second section knows none of the interfaces of the first.
    const Octets second = pcapngSection() + pcapngInterface(113, {}) +
                          pcapngPacket(0, 1'000'000, hex("0000 0001 0006 02*6 0000 0800") + udpPacket);
    writeFile("good.pcapng", first + packets + second);
    writeFile("cut.pcapng", [&] {
        Octets file = first + packets;
        file.resize(file.size() - 9);
        return file;
    }());
    writeFile("unknown.pcapng", first + packets + pcapngSection() + pcapngPacket(0, 0, udpPacket));
    Octets broken = first + packets;
    broken[broken.size() - 1] ^= 0x04; // the second length of the last block
    writeFile("broken.pcapng", broken);
    writeFile("noBlock.pcapng", pcapngSection() + hex("00000001 00000004 00000004"));
    const Octets linkTypes = pcapngSection() + pcapngInterface(147, {}) + pcapngInterface(228, {});
    writeFile("private.pcapng", linkTypes + pcapngPacket(0, 0, udpPacket));
    writeFile("mixed.pcapng", linkTypes + pcapngPacket(0, 0, udpPacket) + pcapngPacket(1, 0, udpPacket));
    const auto octets = static_cast<std::uint32_t>(udpPacket.size());
    writeFile("noted.pcapng", pcapngSection() + pcapngInterface(228, {}) +
                                  pcapngBlock(6, hex("00*12") + be32(octets) + be32(octets) + udpPacket +
                                                     hex("0001 0002 68690000 0000 0000")));

    check({
        {"netfloor keys --column ip.source $T/good.pcapng",
         0,
         {"1,5.000000000,50,1,,,10.0.0.1\n2,102.500000000,36,1,,,10.0.0.1\n3,5.500000000,36,1,,,10.0.0.1\n"
          "4,,50,1,,,10.0.0.1\n5,1.000000000,52,1,,,10.0.0.1\n"},
         {},
         {},
         6},
        {"netfloor keys --column ip.source --where 'ip.ttl == 63' $T/good.pcapng",
         0,
         {"ip.source\n"},
         {},
         {"10.0."},
         1},
        {"netfloor keys --where 'ip.ttl == 64' $T/good.pcapng", 0, {"10.0.0.1"}, {}, {}, 6},
        {"cp $T/good.pcapng $T/'a\"b'; netfloor keys $T/'a\"b' $T/mixed.pcapng",
         0,
         {"/a\"\"b\",1,5.000000000,"},
         {},
         {}},
        {"netfloor detail --jobs 2 $T/noted.pcapng", 0, {"Comment: hi\n"}, {}, {}},
        {"netfloor --jobs 2 --write $T/kept.pcapng $T/noted.pcapng; netfloor detail $T/kept.pcapng",
         0,
         {"Comment: hi\n"},
         {},
         {}},
        {"netfloor -f 'udp port 53' $T/good.pcapng", 0, {"    5  "}, {}, {}, 5},
        // A link type that libpcap does not know costs its own packets, and no others.
        {"netfloor -f udp $T/mixed.pcapng", 0, {"    2  "}, {"1 packet of link type 147 ("}, {"    1  "}, 1},
        {"netfloor -f udp $T/private.pcapng", 2, {}, {"1 packet of link type 147", "leave the filter out"}, {}},
        {"netfloor $T/cut.pcapng",
         4,
         {"    3  "},
         {"in packet 4", "the 3 packets in front of it are whole"},
         {"    4  "},
         3},
        {"netfloor $T/unknown.pcapng", 4, {"    4  "}, {"an interface that is not described in packet 5"}, {}, 4},
        {"netfloor $T/broken.pcapng", 4, {"    3  "}, {"two lengths differ in packet 4"}, {}, 3},
        {"netfloor $T/noBlock.pcapng", 3, {}, {"a block of 4 octets"}, {}},
        {"netfloor $C/pcapng-big-endian-two-interfaces.pcapng", 0, {"192.168.1.139"}, {}, {}, 5},
    });
}

// The examples of the README are what the command prints, and what jq and sqlite3 make of it.
TEST_F(Command, printsWhatTheReadmeShows) {
    std::ifstream readme(NETFLOOR_CAPTURES "/../../README.md");
    ASSERT_EQ(shell("ln -s $C/.. $T/tests && ln -s \"$N\" $T/netfloor").exitCode, 0);
    std::size_t seen = 0;
    for (std::string line; std::getline(readme, line);) {
        const bool isExample = line.starts_with("    $ ./netfloor ") || line.starts_with("    $ sqlite3 ");
        if (!isExample) {
            continue;
        }
        SCOPED_TRACE(line);
        const Outcome outcome = shell("cd $T; " + line.substr(6));
        EXPECT_EQ(outcome.err, "");
        std::istringstream printed(outcome.out);
        for (std::string expected; std::getline(printed, expected) && !expected.empty();) {
            std::getline(readme, line);
            EXPECT_EQ(line, "    " + expected);
        }
        ++seen;
    }
    EXPECT_EQ(seen, 12U);
}

// All that a capture holds goes through all commands, and no packet is lost.
TEST_F(Command, decodesRealCaptures) {
    const Outcome files = shell("ls $C/*.pcap $C/*.pcapng");
    std::istringstream names(files.out);
    std::size_t seen = 0;
    for (std::string name; std::getline(names, name); ++seen) {
        SCOPED_TRACE(name);
        const Outcome keys =
            shell("netfloor keys --column ip.version --column ip.ttl --column source_port '" + name + "'");
        EXPECT_EQ(keys.exitCode, 0) << keys.err;
        // Each packet has a row, and XTR gives the same as MD, which the last column asks for.
        const Outcome all = shell("netfloor keys --column ip.version --column ip.ttl --column source_port "
                                  "--column tcp.window '" +
                                  name + "' | sed 's/,[^,]*$//'");
        EXPECT_EQ(keys.out, all.out);
        const auto packets =
            std::stoi(shell("netfloor keys '" + name + "' | tail -n +2 | cut -d, -f1 | sort -u | wc -l").out);
        EXPECT_GT(packets, 0);
        const Outcome verify = shell("netfloor verify '" + name + "'");
        EXPECT_LE(verify.exitCode, 1) << verify.err;
        EXPECT_NE(verify.out.find(std::to_string(packets) + " packet"), std::string::npos);
        const Outcome detail = shell("netfloor detail --bits '" + name + "' | grep -c '^Packet '");
        EXPECT_EQ(detail.out, std::to_string(packets) + "\n");
        EXPECT_EQ(keys.err + verify.err + detail.err, "");
    }
    EXPECT_GT(seen, 10U);
}

// What matters of each protocol is in its line, no line of real traffic is longer than a wide terminal, and --all has
// the texts of the plug-in.
TEST_F(Command, summaryTellsWhatMatters) {
    writeFile(
        "wide.pcap",
        pcapFile(228,
                 {{ipv4({.protocol = 6, .payload = hex("1000 0050 00000001 00000002 5018 0200 0000 0000 61*8")})}}));
    check({
        {"netfloor $T/wide.pcap",
         0,
         {" TCP             10.0.0.1:4096 > 192.168.0.2:80         [P.] seq 1 ack 2 win 512 len 8\n"},
         {},
         {},
         1},
        {"netfloor --all $T/wide.pcap", 0, {" | TCP | ", " | 10.0.0.1 | 192.168.0.2 | "}, {}, {}, 1},
        {"netfloor -c 1 $C/tcp-md5-bgp.pcap", 0, {"[S] seq 2672392074 win 16384 len 0 <mss 1440,md5>\n"}, {}, {}, 1},
        {"netfloor -c 2 $C/tunnel-gre-sample.pcap",
         0,
         {"66.59.111.190 > 172.28.2.3 ", " in GRE 172.27.1.66 > 66.59.109.137: Echo id 52072 seq 256\n"},
         {},
         {},
         2},
        {"netfloor $C/tunnel-ipip-udp.pcap",
         0,
         {"10.0.0.1:30000 > 10.0.0.2:13000 ", " in IP 1.2.3.4 > 5.6.7.8: len 4\n"},
         {},
         {},
         1},
        {"netfloor $C/tunnel-gre-sample.pcap", 0, {": [SEW] seq 813658343 win 5744"}, {}, {}},
        {"netfloor $C/icmp6-mixed.pcap", 0, {"neighbor solicitation who has fe80::260:97ff:fe07:69ea\n"}, {}, {}},
        {"netfloor $C/icmp-mpls-ext-ppp.pcap",
         0,
         {"Time Exceeded, quotes UDP 12.4.4.4:42315 > 12.1.1.1:33435"},
         {},
         {}},
        {"netfloor $C/sctp-s1ap-sll.pcapng",
         0,
         {" DATA tsn 3479891247 stream 0 seq 0 S1AP", " SACK ack 3479891247"},
         {},
         {}},
        {"netfloor $C/ip4-fragments-tcp.pcap", 0, {"  fragment at 144 id 0x425f\n"}, {}, {}},
        {"netfloor $C/ip6-hop-by-hop-pad1.pcap",
         0,
         {":162 > :0, not decoded: it follows several IPv6 options\n"},
         {},
         {},
         1},
    });
    EXPECT_EQ(shell("for f in $C/*.pcap*; do netfloor $f; done | awk 'length($0) > 160' | wc -l").out, "0\n");
}

// No layer and no chunk overwrites another one.
TEST_F(Command, keysHaveARowForEachLayerOrChunk) {
    check({
        {"netfloor keys $C/tunnel-ipip-udp.pcap",
         0,
         {",1,,,1.2.3.4,,5.6.7.8,,4\n", ",2,IP,,10.0.0.1,30000,10.0.0.2,13000,17\n"},
         {},
         {},
         3},
        {"netfloor keys -c 1 $C/tunnel-gre-sample.pcap", 0, {",2,GRE,,66.59.111.190,,172.28.2.3,,1\n"}, {}, {}, 3},
        {"netfloor keys --per chunk -f sctp $C/sctp-s1ap-sll.pcapng | cut -d, -f11 | sort | uniq -c",
         0,
         {" 0\n", " 3\n"},
         {},
         {}},
        {"netfloor keys --per row $C/tunnel-gre-sample.pcap", 2, {}, {"neither layer nor chunk"}, {}},
    });
}

} // namespace
