#!/bin/sh
# SPDX-License-Identifier: MIT
# Checks the order of the rooms, which are the folders of plugin/: a file includes files of its own room and of rooms on
# lower floors, never of one on the same floor or above. Names each include that breaks the order, and fails.
set -eu
cd "$(dirname "$0")/../plugin"

# One floor a line, the lowest first.
floors='frame
names
ip
transport sctp
ipv4 ipv6
icmp tunnels
packet
tables
entries'

broken=$(
    grep -rnoE --include='*.h' --include='*.cpp' '#include "[a-z0-9_]+/' . | sed -e 's|^\./||' -e 's|#include "||' |
        awk -F: -v floors="$floors" '
            BEGIN {
                count = split(floors, lines, "\n")
                for (i = 1; i <= count; ++i) {
                    rooms = split(lines[i], names, " ")
                    for (j = 1; j <= rooms; ++j) floor[names[j]] = i
                }
                floor["netfloor"] = 0 # the boundary, below all
            }
            {
                from = $1; sub("/.*", "", from)
                to = $3; sub("/.*", "", to)
                if (!(from in floor) || !(to in floor)) print "plugin/" $1 ":" $2 ": the room " (from in floor ? to : from) " has no floor"
                else if (from != to && floor[to] >= floor[from]) print "plugin/" $1 ":" $2 ": " from "/ includes " to "/, which is not below it"
            }'
)
[ -z "$broken" ] && exit 0
echo "$broken"
echo "Move what is shared to a lower room, or what joins the two to a higher one; scripts/check-rooms.sh has the order."
exit 1
