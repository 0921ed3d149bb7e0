# SPDX-License-Identifier: MIT
"""What several tests need: the captures of the repository, and captures made for a test."""

import struct
import subprocess
from pathlib import Path

import pytest

ROOT = Path(__file__).parents[2]
CAPTURES = ROOT / "tests" / "captures"
COMMAND = ROOT / "build" / "cli" / "netfloor"


def captures() -> list[Path]:
    return sorted(path for path in CAPTURES.iterdir() if path.suffix in (".pcap", ".pcapng"))


def write_plan(path: Path, shards: int, plan: Path | None = None) -> Path:
    """By the command; beside the capture unless it is told where."""
    plan = plan or path.with_name(path.name + ".plan.json")
    command = [COMMAND, "plan", "--shards", str(shards), path]
    plan.write_bytes(subprocess.run(command, check=True, capture_output=True).stdout)
    return plan


ABORT = struct.pack(">BBHHH", 6, 0, 16, 12, 12) + b"by users"


def sctp_packet(tsn: int, chunk: bytes = b"") -> bytes:
    """IPv4, SCTP and one chunk: DATA, or the one that is given."""
    chunk = chunk or struct.pack(">BBHIHHI", 0, 3, 20, tsn, 2, 3, 46) + b"data"
    sctp = struct.pack(">HHII", 2905, 2906, 42, 0) + chunk
    addresses = bytes([10, 0, 0, tsn % 250, 192, 168, 0, 2])
    return struct.pack(">BBHHHBBH", 0x45, 0, 20 + len(sctp), tsn & 0xFFFF, 0, 64, 132, 0) + addresses + sctp


def write_pcap(path: Path, packets: list[bytes], link_type: int = 228) -> Path:
    """Nanosecond pcap, of raw IPv4 unless another link type is given, a millisecond and a nanosecond between packets."""
    records = [struct.pack("<IHHiIII", 0xA1B23C4D, 2, 4, 0, 0, 65535, link_type)]
    for number, packet in enumerate(packets):
        time = 1_700_000_000_000_000_000 + number * 1_000_001
        seconds, nanoseconds = divmod(time, 1_000_000_000)
        records.append(struct.pack("<IIII", seconds, nanoseconds, len(packet), len(packet)) + packet)
    path.write_bytes(b"".join(records))
    return path


@pytest.fixture
def sctp_capture(tmp_path: Path) -> Path:
    return write_pcap(tmp_path / "sctp.pcap", [sctp_packet(tsn) for tsn in range(1000)])


@pytest.fixture
def cut_capture(sctp_capture: Path, tmp_path: Path) -> Path:
    """Its last packet, number 1000, is cut."""
    path = tmp_path / "cut.pcap"
    path.write_bytes(sctp_capture.read_bytes()[:-3])
    return path
