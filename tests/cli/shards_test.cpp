// SPDX-License-Identifier: MIT
// The outputs of all shards, joined, are the output of one run.
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "cli/command.h"

using namespace netfloor::test;

namespace {

TEST(PlannedShards, giveTogetherWhatOneRunGives) {
    // All test captures in one file of many interfaces; files of both formats, one of them cut.
    const Outcome made = shell("netfloor --write $T/all.pcapng $C/*.pcap* > $T/out; "
                               "head -c -10 $C/udp-tcp-rawip.pcap > $T/cut.pcap");
    ASSERT_EQ(made.exitCode, 0) << made.err;
    const std::string all = "$T/all.pcapng";
    const std::string vlan = "$C/mixed-pppoe-double-vlan.pcap";
    const std::string several = "$C/pcap-big-endian-nanosecond.pcap $T/cut.pcap $C/ip6-options.pcapng";
    struct Row {
        std::string files;
        int shards;
        const char *command;
        const char *ofAll = "--no-totals";
    };
    const std::vector<Row> rows = {
        {all, 1, "summary"},
        {all, 64, "summary"},
        {all, 64, "keys", ""},
        {all, 64, "json --fields", ""},
        {all, 64, "detail --bits --jobs 2"},
        {vlan, 7, "summary --utc --packet 3-7,90"},
        {vlan, 7, "summary --all --where 'ip.ttl < 65'"},
        {several, 7, "summary"},
        {several, 7, "keys --per chunk", ""},
        {several, 7, "detail --filter udp"},
    };
    for (const auto &[files, shards, command, ofAll] : rows) {
        const std::string line =
            "F=\"" + files + "\"; netfloor " + command + " " + ofAll +
            " $F > $T/whole 2> $T/whole.err; netfloor plan --shards " + std::to_string(shards) +
            " $F > $T/plan.json 2> $T/err; for k in $(jq '.shards[].shard' $T/plan.json); do netfloor " + command +
            " --shard $T/plan.json:$k; done > $T/joined 2> $T/joined.err; [ -s $T/whole ] && "
            "cmp $T/whole $T/joined && cmp $T/whole.err $T/joined.err";
        check({{line}});
    }
}

TEST(PlannedShards, areToldWhenTheyAreWrong) {
    ASSERT_EQ(shell("cp $C/ip6-esp.pcap $T/one.pcap; netfloor plan --shard-size 2K $T/one.pcap > $T/one.json; "
                    "netfloor keys --shard $T/one.json:1")
                  .exitCode,
              0);
    check({
        {"netfloor plan $T/one.pcap", 2, "", "--shards N or --shard-size OCTETS is required"},
        {"netfloor plan --shards 2 $T/none.pcap", 3, "", "No such file"},
        {"cat $T/one.pcap | netfloor plan --shards 2 -", 3, "", "can be read once only"},
        {"gzip -k $T/one.pcap; netfloor plan --shards 2 $T/one.pcap.gz", 0, "\"packed\":true", "it is one shard"},
        {"head -c 500 $T/one.pcap > $T/cut.pcap; netfloor plan --shards 2 $T/cut.pcap", 4, "cut off",
         "cut off at octet 500"},
        {"cp $T/one.pcap $T/$'\\xff'; netfloor plan --shards 1 $T/$'\\xff'", 2, "", "is no UTF-8"},
        {"netfloor keys --shard $T/one.json:0", 2, "", "not of the form PLAN.json:3"},
        {"netfloor keys --shard $T/one.json:999", 2, "", "the plan has only "},
        {"netfloor keys --shard $T/one.pcap:1", 2, "", "is no plan"},
        {"netfloor keys --shard $T/one.json:1 --count 2", 2, "", "--count cannot be kept across shards"},
        {"netfloor keys --shard $T/one.json:1 $T/one.pcap", 2, "", "the plan names the captures"},
        {"netfloor verify --shard $T/one.json:1", 2, "", "--shard"},
        {"netfloor --shard $T/none.json:1", 2, "", "Make a plan: netfloor plan --shards 8"},
        {"sed -E 's/(\"plan_version\": )[0-9]+/\\199/' $T/one.json > $T/new.json; netfloor --shard $T/new.json:1", 2,
         "", "a plan of another version"},
        {"sed 's/\"capture\":0/\"capture\":7/' $T/one.json > $T/no.json; netfloor --shard $T/no.json:1", 2, "",
         "a shard is of no capture"},
        {"sed 's/\"end\":[0-9]*,\"first_packet\":1,/\"end\":1000,\"first_packet\":1,/' $T/one.json > $T/wrong.json; "
         "netfloor --shard $T/wrong.json:1",
         4, "    5  ", "has changed since it was planned. By its plan"},
        {"touch -d yesterday $T/one.pcap; netfloor --shard $T/one.json:2", 3, "",
         "another time of change. Plan it again."},
    });
}

} // namespace
