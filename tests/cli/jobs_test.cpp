// SPDX-License-Identifier: MIT
// Several threads give what one gives, on both sides and at the end.
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "cli/command.h"

using namespace netfloor::test;

namespace {

class Jobs : public testing::Test {
protected:
    // A capture of many blocks: all test captures four times over, with their interfaces and link types.
    static void SetUpTestSuite() {
        const Outcome made = shell("netfloor --write $T/once.pcapng $C/*.pcap* > $T/out && "
                                   "netfloor --write $T/many.pcapng $T/once.pcapng{,,,} > $T/out && "
                                   "{ cat $T/many.pcapng; head -c 50 $T/once.pcapng; } > $T/cut.pcapng");
        ASSERT_EQ(made.exitCode, 0) << made.err;
    }
};

TEST_F(Jobs, giveWhatOneGives) {
    const std::vector<std::string> lines = {
        "netfloor $J $T/many.pcapng",
        "netfloor $J --all --utc $T/many.pcapng",
        "netfloor detail --bits $J $T/many.pcapng",
        "netfloor verify $J $T/many.pcapng",
        "netfloor verify --bad --all $J $T/many.pcapng $C/icmp-types.pcapng $T/many.pcapng",
        "netfloor keys $J $T/many.pcapng $T/once.pcapng",
        "netfloor keys --per chunk $J - < $T/many.pcapng",
        "netfloor json --fields $J $T/many.pcapng $T/once.pcapng",
        "gzip < $T/many.pcapng | netfloor keys --raw $J -",
        "netfloor $J --where 'ip.ttl < 50' --filter 'not tcp' $T/many.pcapng",
        "netfloor $J --packet 3-7,900-1500 $T/many.pcapng",
        "netfloor keys $J --count 700 $T/many.pcapng",
        "netfloor $J --where 'udp.length > 100' --write $T/written.pcapng $T/many.pcapng; netfloor $T/written.pcapng",
        "netfloor $J $T/cut.pcapng",
        "netfloor verify $J $T/cut.pcapng $T/none.pcap",
        "netfloor $J --filter 'no such' $T/many.pcapng",
        "netfloor verify $J $T/many.pcapng > /dev/full",
    };
    for (const std::string &line : lines) {
        SCOPED_TRACE(line);
        const Outcome one = shell("J='--jobs 1'\n" + line);
        for (const char *jobs : {"J='--jobs 2'\n", "J='--jobs 5'\n"}) {
            const Outcome several = shell(jobs + line);
            EXPECT_EQ(several.exitCode, one.exitCode);
            EXPECT_TRUE(several.out == one.out); // too long to be shown
            EXPECT_EQ(several.err, one.err);
        }
    }
}

TEST_F(Jobs, endEarlyInGoodOrder) {
    // The reader of the output goes away; a live source shows what has come; an interrupt leaves whole packets.
    EXPECT_EQ(shell("netfloor keys --jobs 2 $T/many.pcapng | head -n 1; exit ${PIPESTATUS[0]}").exitCode, 0);
    EXPECT_NE(shell("{ head -c 3000 $T/many.pcapng; sleep 5; } | netfloor keys --jobs 2 - | "
                    "{ read -t 3 line; read -t 3 line; echo \"$line\"; }")
                  .out,
              "\n");
    const Outcome interrupted = shell(
        "mkfifo $T/live; $N keys --jobs 2 - < $T/live > $T/out & pid=$!; exec 3> $T/live; cat $T/many.pcapng >&3; "
        "last=0; for i in {1..100}; do now=$(wc -c < $T/out); [ $now = $last ] && [ $now != 0 ] && break; "
        "last=$now; sleep 0.1; done; kill -TERM $pid; wait $pid; code=$?; netfloor keys $T/many.pcapng | "
        "cmp - $T/out; exit $code");
    EXPECT_EQ(interrupted.exitCode, 143);
    EXPECT_EQ(interrupted.out, "");
    EXPECT_NE(interrupted.err.find("interrupted after "), std::string::npos) << interrupted.err;
}

} // namespace
