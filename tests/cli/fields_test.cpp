// SPDX-License-Identifier: MIT
// 'netfloor fields', and the page that it writes.
#include <gtest/gtest.h>

#include "cli/command.h"

namespace netfloor::test {
namespace {

TEST(Fields, showWhatAFieldIs) {
    checkExact({
        // By name, in any case: fields that differ in their ids alone stand together.
        {"netfloor fields VERSION | head -n 14",
         R"(Version
  id       150, IPv4, key field 1
  id       605, ICMP
  id       629, IP in IP
  bits     4
  display  Version=%u
  place    5-8
      8 7 6 5 4 3 2 1
     +-+-+-+-+-+-+-+-+
     |x x x x|. . . .|
     +-+-+-+-+-+-+-+-+

Version
  id       697, GRE
)"},
        {"netfloor fields 856 | tail -n +5 | grep -v '+'", // more than a line, its groups reversed
         R"(  place    16-1, 8 times, 16 bits apart
                      1 1 1 1 1 1 1   2 2 2 2 2 1 1 1 3 3 3 2 2 2 2 2
      8 7 6 5 4 3 2 1 6 5 4 3 2 1 0 9 4 3 2 1 0 9 8 7 2 1 0 9 8 7 6 5
     |x x x x x x x x x x x x x x x x|x x x x x x x x x x x x x x x x|
     |x x x x x x x x x x x x x x x x|x x x x x x x x x x x x x x x x|
     |x x x x x x x x x x x x x x x x|x x x x x x x x x x x x x x x x|
     |x x x x x x x x x x x x x x x x|x x x x x x x x x x x x x x x x|
)"},
        {"netfloor fields 229 | tail -n +3", // nibbles, as many as there are
         R"(  bits     variable
  display  Padding Data=%-["%x"] (Hex)
  place    from 1 on, nibble by nibble, as far as the packet tells
      8 7 6 5 4 3 2 1
     +-+-+-+-+-+-+-+-+
     |x x x x|x x x x|
     +-+-+-+-+-+-+-+-+
)"},
        {"for id in 153 478 643 958 177; do netfloor fields $id | grep place; done",
         R"(  place    1-16, octet by octet
  place    from 1 up to 128, octet by octet
  place    5-8, 1-4, 2 times, 8 bits apart
  place    1-4, 5-8, 9-12, 13-16, as often as the packet tells, 16 bits apart
  place    not told
)"},
        {"netfloor fields tcp.window | head -n 2", "Window Size\n  id       406, TCP\n"}, // as in --where
        {"netfloor fields 555 | head -n 4; netfloor fields discard packet | head -n 3", // names that are missing, short
         R"((no name)
  id       555, ICMP
  bits     variable
  display  nothing
unkown option type, discard packet
  id       243, IPv6 extensions
  names    "unkown option type, discard packet", short "discard packet"
)"},
        {"netfloor fields 247 | tail -n 7; netfloor fields 'UDP Source Port' | grep -A 1 values", // ranges, a default
         R"(    1       Destination Unreachable
    2       Packet Too Big
    3       Time Exceeded
    4       Parameter Problem
    5-127   Undefined
    128     Echo Request
    129     Echo Reply
  values
    other   %u
)"},
        {"netfloor fields port number; netfloor fields tcp | tail -n 1", // a part of names, a protocol: to choose from
         R"(  id      bits   key  protocol               name                                         display
 795        16    76  SCTP                   SCTP Source Port Number                      SCTP Source Port Number=%u
 796        16    77  SCTP                   SCTP Destination Port Number                 SCTP Destination Port Number=%u
2 fields, 2 key fields among them
40 fields, 10 key fields among them
)"},
    });
}

TEST(Fields, areListedInEachForm) {
    checkExact({
        {"n=$(netfloor fields --json | jq length); netfloor fields | sed '1d;$d' | wc -l | sed s/$n/all/; "
         "netfloor fields | tail -n 1 | sed s/$n/all/; netfloor fields | grep '^ 384 '",
         "all\nall fields, 102 key fields among them\n"
         " 384        16    41  TCP                    TCP Source Port                              TCP Source "
         "Port=%-S (%u)\n"},
        {"netfloor fields --json | jq -cS '.[] | select(.id == 295) | [.protocol, .values[-1], .layout]'",
         "[\"IPv4\",{\"from\":138,\"name\":\"Unassigned\",\"to\":252},"
         "{\"count\":1,\"pieces\":[[1,8]],\"step\":8}]\n"},
        {"netfloor fields --json | jq '.[] | select(.id == 295)' | cmp - <(netfloor fields --json 295 | jq '.[]')", ""},
    });
    check({
        {"netfloor fields 'No Such Field'", 2, "", "no field of that name or id"},
        {"netfloor fields 151", 2, "", "no field of that name or id"},
        {"netfloor fields --json --markdown", 2, "", "excludes"},
        {"netfloor fields --plugin $T/absent.so", 5, "", "no such file"},
    });
}

TEST(Fields, pagesOfReferenceAreCurrent) {
    checkExact({{"netfloor fields --markdown | cmp - $C/../../docs/fields.md || echo write it anew", ""},
                {"netfloor fields --tables | cmp - $C/../../docs/columns.md || echo write it anew", ""}});
}

} // namespace
} // namespace netfloor::test
