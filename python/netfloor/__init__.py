# SPDX-License-Identifier: MIT
"""Decodes the IP layers of captured packets: IPv4, IPv6, ICMP, TCP, UDP, SCTP and tunnels.

scan() gives a capture as columns, packets() its packets one by one,
plan() its shards, which several processes can read.
"""

from ._errors import CaptureDamage, CaptureError, ConditionError, PluginError
from ._netfloor import Field, Packet, Shard
from ._plans import read_plan
from ._scan import Column, Scan, columns, packets, plan, scan

__all__ = [
    "CaptureDamage",
    "CaptureError",
    "Column",
    "ConditionError",
    "Field",
    "Packet",
    "PluginError",
    "Scan",
    "Shard",
    "columns",
    "packets",
    "plan",
    "read_plan",
    "scan",
]
