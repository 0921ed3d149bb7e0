// SPDX-License-Identifier: MIT
// The command as a user meets it: what comes out on which side, and how it ends.
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "cli/command.h"

using namespace netfloor::test;

namespace {

const Octets udpPacket = ipv4({.protocol = 17, .payload = udp(40000, 53, hex("61*8"))});

class Command : public testing::Test {
protected:
    static void SetUpTestSuite() {
        const Octets arp = hex("ff*6 02*6 0806 0001 0800 06 04 0001 02*6 0a000001 00*6 0a000002");
        const Octets lldp = hex("ff*6 02*6 88cc 00*46");
        const Octets ethernet = hex("ff*6 02*6 0800") + udpPacket;
        const Octets file = pcapFile(1, {{ethernet}, {arp}, {ethernet}, {lldp}, {arp}});
        writeFile("five.pcap", file);
        writeFile("inPacket.pcap", {file.begin(), file.begin() + 24 + 16 + 50 + 16 + 10});
        writeFile("inFileHead.pcap", {file.begin(), file.begin() + 10});
        writeFile("headerOnly.pcap", {file.begin(), file.begin() + 24});
        writeFile("empty.pcap", {});
        writeFile("foreign.txt", hex("48*300"));
        writeFile("other.zst", hex("28b52ffd 00*20"));
        writeFile("tiny.pcap", pcapFile(228, {{hex("45*10")}, {hex("05*10")}}));
        writeFile("long.pcap", pcapFile(228, std::vector<PcapPacket>(3000, {udpPacket})));
        writeFile("cut.pcap", pcapFile(228, {{udpPacket}, {{udpPacket.begin(), udpPacket.begin() + 24}, 36}}));
        const Octets solicitation = hex("60000000 0020 3a ff fe80 00*13 01 ff02 00*13 02 8700 0000 00*4");
        writeFile("cutSolicitation.pcap", pcapFile(229, {{solicitation, 72}}));
        const Outcome packed = shell("gzip -k $T/five.pcap && head -c -20 $T/five.pcap.gz > $T/half.pcap.gz");
        ASSERT_EQ(packed.exitCode, 0) << packed.err;
    }
};

TEST_F(Command, shows) {
    check({
        // One line a packet, and after them how many were no IP.
        {"netfloor $T/five.pcap", 0,
         " 10.0.0.1:40000 > 192.168.0.2:53 ...no IP: ARP...no IP: LLDP...5 packets: 2 with IP, 3 without (2 ARP, 1 "
         "LLDP)",
         "", "\x1b", 6},
        {"netfloor $T/cutSolicitation.pcap", 0, "neighbor solicitation  [cut by", "", "who has", 1},
        {"netfloor summary $T/cut.pcap", 0, "[cut by the snap length: 24 of 36 octets]", "", "without", 2},
        {"netfloor --all $T/cut.pcap", 0, "Normal Throughput", "", "", 2},
        {"netfloor --utc $T/five.pcap", 0, "2001-09-09T01:46:40.000000Z", "", "", 6},
        {"netfloor --color always $T/five.pcap", 0, "\x1b[2mno IP: ARP\x1b[0m"},
        {"netfloor detail $T/five.pcap", 0,
         "Packet 2  1.000000  42 octets, Ethernet\n  no IP: ARP\n...      Source Address= 10.0.0.1\n...Destination "
         "Port=Domain Name Server (53)\n...Data=8 octets\n            [handed on under key 53 of protocol 17]\n  "
         "[layer 1, octets 0 to 27]\n  [layer 2, octets 28 to 35]\n\n",
         "", "[97-128]"},
        {"netfloor --packet 1 detail --bits $T/five.pcap", 0, "Fragment Offset=0 octets  [49-53,57-64]\n", "", "ARP"},
        {"netfloor detail $T/cut.pcap", 0,
         "UDP Destination Port=Domain Name Server (53)\n          [not captured: from 'UDP Length' on]\n...  cut by "
         "the snap length: 24 of 36"},
        {"netfloor verify $T/five.pcap", 0,
         "  good     good     IPv4: the header checksum is 0...3 without...plug-in: 2 good\nchecks:  2 good\n", "",
         "DAMAGED", 8},
        {"netfloor -r $T/five.pcap --packet 2-3,5", 0, "no IP: ARP...3 packets: 1 with IP", "", "LLDP", 4},
        {"netfloor help detail", 0, "--bits"},
        {"netfloor help", 0, "Exit codes"},
        {"netfloor verify --color always $C/sctp-too-small.pcap", 1, "\x1b[31mDAMAGED"},
        {"netfloor $T/tiny.pcap", 0, "the header ends before the addresses...no whole IP header", "", "", 2},
        {"netfloor keys $T/tiny.pcap", 0, ",no whole IP header,", "", "", 3},
        {"netfloor keys --utc --count 1 $T/five.pcap", 0, "\n1,2001-09-09T01:46:40.000000Z,50"},
        {"netfloor verify --bad $T/five.pcap", 0, "5 packets", "", "no IP: ARP", 3},
        {"netfloor keys --column ip.source --column udp.destination_port $T/five.pcap", 0,
         "packet,time,length,layer,tunnel,note,ip.source,udp.destination_port\n1,1000000000.000000000,50,1,,,10.0.0.1,"
         "53\n2,1000000001.000000000,42,,,no IP: ARP,,\n",
         "", "", 6},
        {"netfloor keys --raw --column ip.source $T/five.pcap", 0, ",0a000001\n"},
        {"netfloor keys --raw --column ip.source $C/sctp-over-ipv6.pcap", 0, ",20010db8000000000000000300020001\n"},
        {"netfloor $C/sctp-over-ipv6.pcap", 0, "  SCTP      [2001:db8::3:2:1]:0 > [2001:db8::3:2:2]:80"},
    });
}

TEST_F(Command, chooses) {
    check({
        {"netfloor --count 1 $T/five.pcap", 0, "    1  ", "", "ARP", 1},
        {"netfloor $T/five.pcap --filter arp -c 1", 0, "    2  ", "", "192.168", 2},
        {"netfloor -f 'udp dst port 53 and src host 10.0.0.1' $T/five.pcap", 0, "    3  ", "", "ARP", 2},
        {"netfloor -f 'udp port 1' $T/five.pcap", 0, ""},
        {"netfloor --packet 9,3-2 $T/five.pcap", 2, "", "'9,3-2' is no list of packet numbers"},
        {"netfloor --packet 6 $T/five.pcap", 2, "", "has only 5 packets"},
        {"netfloor --packet 1 -f arp $T/five.pcap", 2, "", "does not match the filter"},
        {"netfloor -f 'no such' $T/five.pcap", 2, "", "pcap-filter"},
        {"netfloor --where 'ip.ttl <' $T/five.pcap", 2, "", "--where: ...\n    ip.ttl <\n            ^"},
        {"netfloor --where $'ip.no\\e' $T/five.pcap", 2, "", "--where: ...^", "\x1b"},
        {"mkdir -p $T/apart; cp $N $T/apart; LD_LIBRARY_PATH=$(dirname $N)/.. $T/apart/netfloor $T/five.pcap", 5, "",
         "the plug-in was not found at ...--plugin PATH"},
        {"netfloor keys --column Nothing $T/five.pcap", 2, "", "'Nothing'...'ip.ttl' (Time to Live)"},
        {"netfloor --packet 0 $T/five.pcap", 2, "", "'0' is no list of packet numbers...--help"},
        {"netfloor --count -1 $T/five.pcap", 2, "", "'-1' is no whole number"},
        {"netfloor --color blue $T/five.pcap", 2, "", "'blue' is none of auto, always and never"},
        {"netfloor detial $T/five.pcap", 2, "", "'detial' is neither a command nor a file"},
        {"netfloor detail", 2, "", "file is required"},
        {"netfloor --help", 0, "Exit codes:"},
        {"netfloor", 0, "Usage: netfloor"},
    });
}

TEST_F(Command, readsAnyWay) {
    check({
        {"cat $T/five.pcap | netfloor -", 0, "5 packets", "", "", 6},
        {"netfloor $T/five.pcap.gz", 0, "5 packets", "", "", 6},
        {"netfloor - < $T/five.pcap.gz", 0, "5 packets", "", "", 6},
        {"cat <(head -c 100 $T/five.pcap | gzip) <(tail -c +101 $T/five.pcap | gzip) | netfloor -", 0, "5 packets", "",
         "", 6},
        {"cat $T/five.pcap | netfloor keys --jobs 2 -", 0, "\n5,", "", "", 6},
        // A live source shows each packet as it comes.
        {"{ head -c 90 $T/five.pcap; sleep 5; } | netfloor - | { read -t 3 line; echo \"$line\"; }", 0, "10.0.0.1", "",
         "", 1},
    });
}

// Packet numbers are a file's; one that cannot be read does not keep the others from being read.
TEST_F(Command, readsSeveralFiles) {
    check({
        {"netfloor -c 1 $T/five.pcap $T/cut.pcap | sed \"s|$T/||\"", 0,
         "==> five.pcap <==\n    1  ...\n\n==> cut.pcap <==\n    1  ...\n\n==> all 2 captures <==\n2 packets: 2 with "
         "IP\n",
         "", "", 8},
        {"cd $T; netfloor keys --column ip.source five.pcap - < cut.pcap", 0,
         "file,packet,time...\nfive.pcap,1,1000000000.000000000,50,1,,,10.0.0.1\n...\nstandard input,2,", "", "==>", 8},
        {"netfloor verify --bad $T/five.pcap $C/tcp-urgent-loopback.pcap | tail -n 3", 0,
         "64 packets: 61 with IP, 3 without (2 ARP, 1 LLDP)\nplug-in: 2 good, 57 good with flags by design, 2 "
         "damaged\nchecks:  54 good, 7 damaged\n"},
        {"netfloor verify --bad $C/tcp-urgent-loopback.pcap $T/five.pcap", 1, "all 2"},
        {"netfloor detail $T/five.pcap $T/cut.pcap", 0, "==> all 2 captures <==\n7 packets"},
        {"netfloor $T/inPacket.pcap $T/missing.pcap $T/five.pcap", 3, "    1  ...5 packets...all 3",
         "cut off at octet 116...No such file", "missing.pcap <=="},
        {"netfloor $T/inPacket.pcap $T/five.pcap", 4, "all 2", "cut off at octet 116"},
        {"netfloor --packet 3 $T/five.pcap $T/cut.pcap", 2, "    3  ", "has only 2 packets"},
        {"netfloor $T $T/five.pcap", 3, "5 packets", "is a folder. Name the captures in it"},
        {"netfloor \"$T/no*.pcap\" $T/five.pcap", 2, "", "neither a command nor a file"},
        {"netfloor summary \"$T/no*.pcap\"", 3, "", "unless none matches"},
        {"netfloor - - < $T/five.pcap", 2, "", "can be read once"},
        {"netfloor -f udp --write $T/both.pcapng $T/five.pcap $T/five.pcap > $T/out; netfloor $T/both.pcapng", 0,
         "    4  ", "", "", 4},
        {"cd $T; netfloor --write five.pcap cut.pcap five.pcap", 2, "", "is a capture that is read"},
    });
}

TEST_F(Command, endsWithACodeAndASentence) {
    check({
        // Cut captures: all whole packets, then the place.
        {"netfloor $T/inPacket.pcap", 4, "    1  ",
         "cut off at octet 116, in packet 2, which begins at octet 90 of the file; the 1 packet in front", "", 1},
        {"netfloor $T/half.pcap.gz", 4, "    1  ", "packed data end in the middle...of the unpacked capture"},
        {"cat $T/half.pcap.gz | netfloor -", 4, "    1  ", "packed data end in the middle"},
        {"{ head -c 40 $T/five.pcap.gz; head -c 99 /dev/zero; } | netfloor -", 4, "", "the packed data are damaged ("},
        // Files that are no captures.
        {"netfloor $T/inFileHead.pcap", 3, "", "no usable capture header"},
        {"netfloor $T/missing.pcap", 3, "", "No such file...Check the path"},
        {"netfloor $T/empty.pcap", 3, "", "is empty"},
        {"netfloor - < /dev/null", 3, "", "standard input is empty"},
        {"netfloor /proc/self/mem", 3, "", "Input/output error"},
        {"printf '\\xd4\\xc3\\xb2\\xa1\\1\\0\\0\\0%016d' 0 | netfloor -", 3, "",
         "version 1.0 of the format has no known form"},
        {"netfloor $T/foreign.txt", 3, "", "neither a pcap nor a pcapng...editcap"},
        {"netfloor $T/other.zst", 3, "", "zstd -dc FILE | netfloor -"},
        {"netfloor $T", 3, "", "is a folder"},
        {"netfloor $T/headerOnly.pcap", 0, "", "holds no packets"},
        // The plug-in and the output.
        {"netfloor --plugin $T/none.so $T/five.pcap", 5, "", "none.so"},
        {"netfloor --plugin $T/foreign.txt $T/five.pcap", 5, "", "foreign.txt"},
        {"netfloor $T/five.pcap > /dev/full", 6, "", "No space left"},
        {"mkdir $T/bare; touch $T/bare/lib{pcap.so.0.8,pcap.so.1,sqlite3.so.0}; export LD_LIBRARY_PATH=$T/bare; "
         "netfloor -f udp $T/five.pcap",
         2, "", "A filter needs libpcap"},
        {"LD_LIBRARY_PATH=$T/bare netfloor export --to $T/no.db $T/five.pcap", 6, "", "needs SQLite"},
        // Nobody foresaw a current folder that is gone.
        {"ln -s $P $T/link.so; mkdir $T/gone; cd $T/gone; rmdir $T/gone; netfloor --plugin ../link.so $T/five.pcap", 7,
         "", "a fault of netfloor itself...Please report it"},
        // The reader of a long output goes away.
        {"for i in 1 2 3 4 5 6; do netfloor detail $C/udp-tcp-rawip.pcap; done | head -n 1; exit ${PIPESTATUS[0]}", 0,
         "Packet 1"},
        {"netfloor detail $C/mixed-pppoe-double-vlan.pcap | head -n 1; exit ${PIPESTATUS[0]}", 0, "Packet 1"},
    });
}

#if !defined(__SANITIZE_ADDRESS__) // which takes more addresses than the limit gives
TEST_F(Command, tellsWhenMemoryRunsOut) {
    const Octets large = udpPacket + Octets(std::size_t{15} << 20U);
    writeFile("large.pcapng", pcapngSection() + pcapngInterface(228, {}) + pcapngPacket(0, 0, large));
    check({
        {"netfloor $T/large.pcapng", 0, "10.0.0.1"},
        // The libraries alone take more or less by the system: the limit goes up until the command starts.
        {"for kib in {8000..200000..4000}; do (ulimit -v $kib; netfloor $T/large.pcapng) >$T/out 2>$T/err; code=$?; "
         "case $code in 5 | 127) ;; *) break ;; esac; done; cat $T/err >&2; exit $code",
         8, "", "memory ran out"},
    });
}
#endif

// What is found out only when the output is written; and what must not reach a terminal.
TEST_F(Command, tellsWhatBecameOfItsAnswer) {
    check({
        {"netfloor --help > /dev/full", 6, "", "No space left"},
        {"netfloor --version >&-", 6, "", "standard output is closed"},
        {"netfloor $T/five.pcap >&-", 6, "", "standard output is closed"},
        {"netfloor --help | true; exit ${PIPESTATUS[0]}", 0, ""},
        {"netfloor $'bad\\e]0;name\\x9b\\xc2\\x9b'", 3, "", "bad\\x1b]0;name\\x9b\\xc2\\x9b:", "\x1b"},
        {"netfloor --plugin $'\\e.so' $T/five.pcap", 5, "", "\\x1b.so", "\x1b"},
        {"netfloor --count $'\\e' $T/five.pcap", 2, "", "'\\x1b'", "\x1b"},
        {"netfloor 'caf\xc3\xa9'", 3, "", "caf\xc3\xa9:"},
    });
}

// On a terminal: colours unless they are not wanted, lines of its width, and how far a long reading is.
TEST_F(Command, knowsATerminal) {
    const std::string coloured = "\x1b[2mno IP: ARP";
    const auto onTerminal = [](const std::string &line) { return " script -qec \"" + line + "\" /dev/null"; };
    check({
        {"env -u TERM -u NO_COLOR" + onTerminal("$N $T/five.pcap"), 0, coloured.c_str()},
        {"TERM=xterm NO_COLOR=" + onTerminal("$N $T/five.pcap"), 0, coloured.c_str()},
        {"TERM=xterm NO_COLOR=1" + onTerminal("$N $T/five.pcap"), 0, "no IP: ARP", "", "\x1b"},
        {"TERM=dumb" + onTerminal("$N $T/five.pcap"), 0, "no IP: ARP", "", "\x1b"},
        {onTerminal("stty cols 70; $N --color never $C/tcp-md5-bgp.pcap") + " | tr -d '\\r' | wc -L", 0, "70\n"},
        {onTerminal("$N detail --color never $T/long.pcap | (sleep 0.8; wc -l)"), 0,
         "\r[#... %  ... packets...\r\x1b[K"},
        {onTerminal("cat $T/five.pcap | $N keys - | wc -l"), 0, "6\r\n"},
        {onTerminal("$N -"), 3, "is a terminal"},
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
        {whole.c_str(), 143, "5 packets: 2 with IP...checks:  2 good", "interrupted after 5 packets", "cut"},
        {inPacket.c_str(), 143, "5 packets: 2 with IP", "interrupted after 5 packets", "cut"},
    });
}

// What every packet of a kind leaves by design is told apart from damage, and only damage makes the exit code.
TEST_F(Command, tellsFlagsByDesignFromDamage) {
    const Octets tcpHead = hex("0050 9c40 00000001 00000000");
    const Octets sctpHead = hex("0b59 0b59 00000000 00000000");
    const Octets init = hex("01 00 0014 00000001 00010000 000a 000a 00000001");
    const Octets padded = hex("01 00 0022 00000001 00010000 000a 000a 00000001 0005 0008 0a000001 000c 0006 0005 0000");
    Octets longInit = init;
    longInit[3] = 0x20; // the length says 12 octets more
    const auto sctp = [&](const Octets &chunks) { return ipv4({.protocol = 132, .payload = sctpHead + chunks}); };
    const auto tcp = [&](const char *rest) { return ipv4({.protocol = 6, .payload = tcpHead + hex(rest)}); };
    struct Row {
        Octets packet;
        std::uint32_t wireOctets;
        const char *verdict; // of the plug-in
        const char *expected;
        int exitCode; // with the verdict of the checks
    };
    const std::vector<Row> rows = {
        {udpPacket, 0, "good", "", 0},
        {tcp("5002 0100 0000 0000"), 0, "good", "0x2 every TCP header", 0},
        {tcp("5002 0100 0000 0000 61*4"), 0, "good", "at most 4 octets", 0},
        {ipv4({.protocol = 17, .payload = udp(1, 2, hex("61*4"))}), 0, "good", "0x10 a UDP payload", 0},
        {ipv4({.protocol = 47, .payload = hex("0000 0800 45*20")}), 0, "good", "0x2 every GRE payload", 1},
        {sctp(init), 0, "good", "0x8 an SCTP INIT", 0},
        {ipv4({.protocol = 17, .payload = hex("0001 0002 00")}), 0, "unread",
         "0x10 bits left over inside a length: 1 octet after 'UDP Destination Port' at octet 23 (User "
         "Datagram Protocol)",
         1},
        {sctp(padded), 0, "unread", // padding, and fields after it
         "octet after 'Address Type' at octet", 0},
        {tcp("f002 0100 0000 0000"), 0, "DAMAGED", "0x2 every TCP header", 1},
        {sctp(longInit), 0, "DAMAGED", "0x8 length reaches past the bits left", 1},
        {sctp(hex("09 00 000c 0003 0008 00000005")), 0, "good", "0x8 a list of SCTP error causes", 0},
        {sctp(hex("06 00 000c 0005 0008 00000005")), 0, "good", "0x8 a list of SCTP error causes", 0},
        {sctp(hex("06 00 000c 0003 0010 00000005")), 0, "DAMAGED", "0x8", 1},
        {sctp(hex("09 00 0010 0003 0008 00000005")), 0, "DAMAGED", "0x8", 1},
        {ipv4({.protocol = 47, .payload = hex("0000")}), 0, "DAMAGED", "0x2 expectation not met: something is shorter",
         1},
        // The octets of the identification are read from the last one on, which is no gap in front of them.
        {ipv6({.nextHeader = 44, .payload = hex("3a 00 0001 00000007  87*9")}), 0, "unread",
         "8 octets after 'ICMP Message Type' at octet 48", 1},
        {ipv4({.protocol = 1, .payload = hex("08 01 0000 0001 0001")}), 0, "misread",
         "0x2 expectation not met after 'ICMP Message Type' at octet 20", 1},
        // The capture, not the sender, has cut the first.
        {sctp(longInit), 60, "cut", "0x8", 1},
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
        {"netfloor detail --packet 1 $T/texts.pcap", 0,
         "Next Header=IPv6-ICMP  (58)\n...ICMP Message Type=  (135)\n...[in no field: octets 41 to 63]\n", "",
         "\n          Source IP Address  ("},
        {"netfloor detail --all --packet 1 $T/texts.pcap", 0, "\n          Source IP Address  (2001:db8::1)"},
        {"netfloor detail --packet 2 $T/texts.pcap", 0,
         "64-bit Original Data Datagram: 8 octets\n              00 35 00 07 00 08 00 01\n...[in no field: octets 56 "
         "to 57]\n"},
        {"netfloor detail --packet 3 $T/texts.pcap", 0, "Message Data=\\x1b\n...Data=A\n", "", "\x1b"},
        {"netfloor --all --packet 3 $T/texts.pcap", 0, "\\x1b", "", "\x1b"},
    });
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
    const Octets linkTypes = pcapngSection() + pcapngInterface(147, {}) + pcapngInterface(228, {});
    writeFile("private.pcapng", linkTypes + pcapngPacket(0, 0, udpPacket));
    writeFile("mixed.pcapng", linkTypes + pcapngPacket(0, 0, udpPacket) + pcapngPacket(1, 0, udpPacket));
    Octets manyTypes = pcapngSection();
    for (std::uint16_t i = 0; i < 5; ++i) { // for private use
        manyTypes = manyTypes + pcapngInterface(147 + i, {}) + pcapngPacket(i, 0, udpPacket);
    }
    writeFile("types.pcapng", manyTypes);
    writeFile("odd.pcapng", first + hex("00000bad 0000000f 010203 00 0000000f") + pcapngPacket(1, 0, udpPacket));
    const auto octets = static_cast<std::uint32_t>(udpPacket.size());
    writeFile("noted.pcapng", pcapngSection() + pcapngInterface(228, {}) +
                                  pcapngBlock(6, hex("00*12") + be32(octets) + be32(octets) + udpPacket +
                                                     hex("0001 0002 68690000 0000 0000")));

    check({
        {"netfloor keys --column ip.source $T/good.pcapng", 0,
         "1,5.000000000,50,1,,,10.0.0.1\n2,102.500000000,36,1,,,10.0.0.1\n3,5.500000000,36,1,,,10.0.0.1\n4,,50,1,,,10."
         "0.0.1\n5,1.000000000,52,1,,,10.0.0.1\n",
         "", "", 6},
        {"netfloor keys --column ip.source --where 'ip.ttl == 63' $T/good.pcapng", 0, "ip.source\n", "", "10.0.", 1},
        {"netfloor keys --where 'ip.ttl == 64' $T/good.pcapng", 0, "10.0.0.1", "", "", 6},
        {"cp $T/good.pcapng $T/'a\"b'; netfloor keys $T/'a\"b' $T/mixed.pcapng", 0, "/a\"\"b\",1,5.000000000,"},
        {"netfloor detail --jobs 2 $T/noted.pcapng", 0, "Comment: hi\n"},
        {"netfloor --jobs 2 --write $T/kept.pcapng $T/noted.pcapng; netfloor detail $T/kept.pcapng", 0,
         "Comment: hi\n"},
        {"netfloor -f 'udp port 53' $T/good.pcapng", 0, "    5  ", "", "", 5},
        // A link type that libpcap does not know costs its own packets, and no others.
        {"netfloor -f udp $T/mixed.pcapng", 0, "    2  ", "1 packet of link type 147 (", "    1  ", 1},
        {"netfloor -f udp $T/private.pcapng", 2, "", "1 packet of link type 147...leave the filter out"},
        {"netfloor -f udp $T/types.pcapng", 2, "", "1 packet of link type 149 (...and packets of 2 more link types."},
        {"netfloor $T/odd.pcapng", 0, "    1  ", "are no multiple of four", "", 1},
        {"netfloor $C/pcapng-big-endian-two-interfaces.pcapng", 0, "192.168.1.139", "", "", 5},
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

// XTR gives the same as MD, which the last column asks for.
TEST_F(Command, keysAreTheSameByEachPass) {
    checkExact({
        {"K='netfloor keys --column ip.version --column ip.ttl --column source_port'; for f in $C/*.pcap*; do "
         "$K --column tcp.window $f | sed 's/,[^,]*$//' >$T/md; $K $f | cmp - $T/md || echo $f; done",
         ""},
    });
}

// What matters of each protocol is in its line, no line of real traffic is longer than a wide terminal, and --all has
// the texts of the plug-in.
TEST_F(Command, summaryTellsWhatMatters) {
    writeFile(
        "wide.pcap",
        pcapFile(228,
                 {{ipv4({.protocol = 6, .payload = hex("1000 0050 00000001 00000002 5018 0200 0000 0000 61*8")})}}));
    check({
        {"netfloor $T/wide.pcap", 0,
         " TCP             10.0.0.1:4096 > 192.168.0.2:80         [P.] seq 1 ack 2 win 512 len 8\n"},
        {"netfloor --all $T/wide.pcap", 0, " | TCP | ... | 10.0.0.1 | 192.168.0.2 | "},
        {"netfloor -c 1 $C/tcp-md5-bgp.pcap", 0, "[S] seq 2672392074 win 16384 len 0 <mss 1440,md5>\n"},
        {"netfloor -c 2 $C/tunnel-gre-sample.pcap", 0,
         "66.59.111.190 > 172.28.2.3 ... in GRE 172.27.1.66 > 66.59.109.137: Echo id 52072 seq 256\n"},
        {"netfloor $C/tunnel-ipip-udp.pcap", 0, "10.0.0.1:30000 > 10.0.0.2:13000 ... in IP 1.2.3.4 > 5.6.7.8: len 4\n"},
        {"netfloor $C/tunnel-gre-sample.pcap", 0, ": [SEW] seq 813658343 win 5744"},
        {"netfloor $C/icmp6-mixed.pcap", 0, "neighbor solicitation who has fe80::260:97ff:fe07:69ea\n"},
        {"netfloor $C/icmp-mpls-ext-ppp.pcap", 0, "Time Exceeded, quotes UDP 12.4.4.4:42315 > 12.1.1.1:33435"},
        {"netfloor $C/sctp-s1ap-sll.pcapng", 0, " DATA tsn 3479891247 stream 0 seq 0 S1AP... SACK ack 3479891247"},
        {"netfloor $C/ip4-fragments-tcp.pcap", 0, "  fragment at 144 id 0x425f\n"},
        {"netfloor $C/ip6-hop-by-hop-pad1.pcap", 0, ":162 > :0, not decoded: it follows several IPv6 options\n"},
    });
    EXPECT_EQ(shell("for f in $C/*.pcap*; do netfloor $f; done | awk 'length($0) > 160' | wc -l").out, "0\n");
}

// No layer and no chunk overwrites another one.
TEST_F(Command, keysHaveARowForEachLayerOrChunk) {
    check({
        {"netfloor keys $C/tunnel-ipip-udp.pcap", 0,
         ",1,,,1.2.3.4,,5.6.7.8,,4\n...,2,IP,,10.0.0.1,30000,10.0.0.2,13000,17\n", "", "", 3},
        {"netfloor keys -c 1 $C/tunnel-gre-sample.pcap", 0, ",2,GRE,,66.59.111.190,,172.28.2.3,,1\n", "", "", 3},
        {"netfloor keys --per chunk -f sctp $C/sctp-s1ap-sll.pcapng | cut -d, -f11 | sort | uniq -c", 0, " 0\n... 3\n"},
        {"netfloor keys --per row $C/tunnel-gre-sample.pcap", 2, "", "neither layer nor chunk"},
    });
}

} // namespace
