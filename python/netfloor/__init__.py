# SPDX-License-Identifier: MIT
"""Decodes the IP layers of captured packets: IPv4, IPv6, ICMP, TCP, UDP, SCTP and tunnels.

scan() gives a capture as columns, packets() its packets one by one.
"""

from ._errors import CaptureDamage, CaptureError, ConditionError, PluginError
from ._netfloor import Field, Packet
from ._scan import Column, Scan, columns, packets, scan

__all__ = [
    "CaptureDamage",
    "CaptureError",
    "Column",
    "ConditionError",
    "Field",
    "Packet",
    "PluginError",
    "Scan",
    "columns",
    "packets",
    "scan",
]
