# SPDX-License-Identifier: MIT
"""Captures as columns."""

import os
from collections.abc import Sequence
from pathlib import Path
from typing import Any, NamedTuple

from . import _netfloor

PLUGIN = str(Path(__file__).parent / "lib" / "netfloor" / "libnetfloor.so")


class Column(NamedTuple):
    """A column of a table, such as ip_ttl. A condition calls it by field, ip.ttl; required if no row is without it."""

    name: str
    field: str
    type: str
    meaning: str
    required: bool


def columns(table: str = "layers") -> list[Column]:
    """The columns of a table: "packets", "layers", "chunks" or "causes"."""
    return [Column(*row) for row in _netfloor.columns(table)]


class Scan:
    """The rows of one table of a capture. Nothing is read before a reader asks for the stream.

    Each reader gets a stream of its own: a scan may be read any number of times, also by several threads.
    """

    def __init__(
        self,
        path: str | os.PathLike[str],
        table: str = "layers",
        *,
        where: str | None = None,
        columns: Sequence[str] | None = None,
        binary_addresses: bool = False,
        shard: _netfloor.Shard | None = None,
    ) -> None:
        if columns is not None and (isinstance(columns, str) or not columns):
            raise ValueError("columns is a list of at least one name, or None for all.")
        self._path = os.fspath(path)
        self._table = table
        self._scan = _netfloor.ColumnScan(
            self._path, PLUGIN, table, list(columns or []), where or "", binary_addresses, shard
        )

    def __arrow_c_schema__(self) -> Any:
        """The type of the rows. The capture is not read."""
        return self._scan.schema()

    def __arrow_c_stream__(self, requested_schema: Any = None) -> Any:
        """A new stream of record batches.

        A damaged capture gives the rows of the packets before the damage; then the reader raises an error with the
        file and the packet. requested_schema is not followed, as the interface allows: cast the batches.
        """
        return self._scan.stream()

    def __repr__(self) -> str:
        return f"<Scan of {self._table} in {self._path}>"


def scan(
    path: str | os.PathLike[str],
    table: str = "layers",
    *,
    where: str | None = None,
    columns: Sequence[str] | None = None,
    binary_addresses: bool = False,
    shard: _netfloor.Shard | None = None,
) -> Scan:
    """The rows of one table of a capture, for any library that takes an Arrow C stream.

        pyarrow.RecordBatchReader.from_stream(netfloor.scan("traffic.pcap"))
        duckdb.sql("select ip_source, count(*) from layers group by all")   # with layers = netfloor.scan(...)
        polars.DataFrame(netfloor.scan("traffic.pcap", "chunks"))

    table is "packets", "layers" (a row for each IP header), "chunks" or "causes" (of SCTP). where is a condition such as
    "tcp.port == 443 and ip.ttl < 5": the rows for which it holds. columns chooses and orders the columns, all by default;
    columns() lists them. Addresses are strings, dictionary-encoded; with binary_addresses they are 4 or 16 octets.
    shard reads one shard of plan() alone, with the packet numbers of the whole capture.

    Raises ValueError for a table, column or condition without meaning, at once, and CaptureError when the stream is
    opened.
    """
    return Scan(path, table, where=where, columns=columns, binary_addresses=binary_addresses, shard=shard)


def plan(
    path: str | os.PathLike[str], shards: int = 0, *, shard_octets: int = 0
) -> list[_netfloor.Shard]:
    """Cuts a capture into shards: into about so many, or of so many octets each.

    The rows of all shards, one after the other, are those of the capture. It hops from packet to packet, and decodes
    nothing. A capture that is packed with gzip is one shard. A file that has changed since it was planned is refused.
    """
    if (shards > 0) == (shard_octets > 0):
        raise ValueError("Give either shards or shard_octets, above 0.")
    size = shard_octets or max(1, -(-os.path.getsize(path) // shards))
    return _netfloor.plan(os.fspath(path), size)


def packets(path: str | os.PathLike[str]) -> _netfloor.PacketReader:
    """The packets of a capture one by one, for scripts that look at single packets.

        for packet in netfloor.packets("traffic.pcap"):
            for field in packet.fields():
                print(packet.number, field.path, field.text, field.bits)

    Raises CaptureError, and CaptureDamage at the place where a damaged capture ends.
    """
    return _netfloor.PacketReader(os.fspath(path), PLUGIN)
