# SPDX-License-Identifier: MIT
"""Captures behind URLs, through fsspec."""

import contextlib
import os
from collections.abc import Iterator
from typing import Any

import fsspec

from ._errors import CaptureError
from ._netfloor import Shard

_PIECE = 1 << 24  # octets of one request
_START = 4096  # of the file and of each block, more than most need
_SECTION_HEADER = b"\x0a\x0d\x0d\x0a"


@contextlib.contextmanager
def in_memory(url: str, shard: Shard | None) -> Iterator[str]:
    """A path at which this process can open the capture: all of it or, with a shard, what the shard needs."""
    memory = os.memfd_create("netfloor")
    try:
        if shard is None or shard.is_packed:
            _fetch_all(memory, url)
        else:
            _Ranges(memory, url, shard).fetch()
        if shard is not None:
            # A plan knows the file by its time of change, too, and a copy behind a URL has another one, or none.
            os.utime(memory, ns=(shard.file_modified_ns, shard.file_modified_ns))
        yield f"/proc/self/fd/{memory}"
    finally:
        os.close(memory)


def read_beside(url: str, ending: str) -> bytes | None:
    """The octets of the file whose URL is longer by the ending, or None."""
    filesystem, name = fsspec.url_to_fs(url + ending)
    return bytes(filesystem.cat_file(name)) if filesystem.exists(name) else None


def _fetch_all(memory: int, url: str) -> None:
    with fsspec.open(url, "rb") as remote:
        while piece := remote.read(_PIECE):
            os.write(memory, piece)


class _Ranges:
    """Each octet that is fetched lies at its place in a file with holes, which take no memory."""

    def __init__(self, memory: int, url: str, shard: Shard) -> None:
        self._memory = memory
        self._url = url
        self._shard = shard
        self._files: Any
        self._files, self._name = fsspec.url_to_fs(url)
        self._size = shard.file_octets
        self._fetched = 0  # octets from the start of the file on

    def fetch(self) -> None:
        size = self._files.size(self._name)
        if size is not None and size != self._size:
            raise CaptureError(
                f"{self._url} is not what it was when it was planned: it had {self._size} octets and has {size}. "
                "Plan it again."
            )
        os.ftruncate(self._memory, self._size)
        self._range(0, _START)
        self._fetched = _START
        if os.pread(self._memory, 4, 0) == _SECTION_HEADER:
            self._blocks()
        self._range(self._shard.begin, self._size if self._shard.end is None else self._shard.end)

    def _blocks(self) -> None:
        order: Any = "little"
        for begin in [0, *self._shard.blocks_before]:
            self._range(begin, begin + _START)
            if os.pread(self._memory, 4, begin) == _SECTION_HEADER:
                order = "big" if os.pread(self._memory, 1, begin + 8) == b"\x1a" else "little"
            octets = int.from_bytes(os.pread(self._memory, 4, begin + 4), order)
            self._range(begin + _START, begin + octets)

    def _range(self, begin: int, end: int) -> None:
        end = min(end, self._size)
        for at in range(max(begin, self._fetched), end, _PIECE):
            last = min(at + _PIECE, end)
            octets = self._files.cat_file(self._name, start=at, end=last)
            if len(octets) != last - at:
                raise CaptureError(f"{self._url}: octets {at} to {last} were asked for, and {len(octets)} came.")
            os.pwrite(self._memory, octets, at)
