# SPDX-License-Identifier: MIT
from typing import Any

class Shard:
    """A range of a capture that can be read by itself: pickle it, and read it by scan() in any process.

    begin and end are octets of the file, end None for the rest of it.
    """
    @property
    def path(self) -> str: ...
    @property
    def begin(self) -> int: ...
    @property
    def end(self) -> int | None: ...
    @property
    def first_packet(self) -> int: ...
    @property
    def packets(self) -> int: ...
    @property
    def first_time_ns(self) -> int | None: ...
    @property
    def file_octets(self) -> int:
        """The size of the capture when it was planned."""
    @property
    def file_modified_ns(self) -> int:
        """Its time of change then, since 1970."""
    @property
    def is_packed(self) -> bool:
        """Whether it is packed with gzip."""
    @property
    def blocks_before(self) -> list[int]:
        """The octets at which the pcapng blocks begin that a reader of the shard needs before it."""
    def __getstate__(self) -> Any: ...
    def __setstate__(self, state: Any) -> None: ...

def plan(path: str, shard_octets: int) -> list[Shard]: ...

class ColumnScan:
    def __init__(
        self,
        path: str,
        plugin: str,
        table: str,
        columns: list[str],
        where: str,
        binary_addresses: bool,
        shard: Shard | None,
    ) -> None: ...
    def stream(self) -> Any: ...
    def schema(self) -> Any: ...

def columns(table: str) -> list[tuple[str, str, str, str, bool]]: ...

class Field:
    """One field of a packet.

    path names the blocks around it; value is the number that the packet has; bits are ranges of bits from the IP header
    on, from 1, and within an octet from the least significant up.
    """
    @property
    def id(self) -> int: ...
    @property
    def name(self) -> str: ...
    @property
    def text(self) -> str: ...
    @property
    def value(self) -> int: ...
    @property
    def path(self) -> str: ...
    @property
    def bits(self) -> list[tuple[int, int]]: ...

class Packet:
    """One packet. time_ns counts from 1970 UTC; length is that on the wire, octets what was captured."""
    @property
    def number(self) -> int: ...
    @property
    def time_ns(self) -> int | None: ...
    @property
    def link_type(self) -> int: ...
    @property
    def length(self) -> int: ...
    @property
    def octets(self) -> bytes: ...
    @property
    def ip_offset(self) -> int | None:
        """Where the IP header begins in octets; None without IP."""
    @property
    def no_ip(self) -> str | None:
        """What a packet without IP is, such as "ARP"."""
    def fields(self) -> list[Field]:
        """Every field in the order in which they are read; none without IP."""
    def texts(self) -> list[str]:
        """The short texts, as a list of packets shows them."""

class PacketReader:
    def __init__(self, path: str, plugin: str) -> None: ...
    def __iter__(self) -> PacketReader: ...
    def __next__(self) -> Packet: ...
