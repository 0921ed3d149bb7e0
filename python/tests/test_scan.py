# SPDX-License-Identifier: MIT
"""Columns, as the libraries take them that people use."""

import subprocess
import sys
import threading
from pathlib import Path

import duckdb
import netfloor
import pandas
import polars
import pyarrow as pa
import pytest

from conftest import sctp_packet, write_pcap

def test_values_have_the_types_of_their_columns(sctp_capture: Path) -> None:
    table = pa.table(netfloor.scan(sctp_capture, "chunks"))
    row = table.slice(7, 1).to_pylist()[0]
    assert table.schema.field("time").type == pa.timestamp("ns", "UTC")
    assert table.schema.field("ip_source").type == pa.dictionary(pa.int32(), pa.string())
    assert table["time"].cast(pa.int64())[7].as_py() == 1_700_000_000_000_000_000 + 7 * 1_000_001
    assert (row["ip_source"], row["sctp_tsn"], row["sctp_unordered"], row["sctp_cause"]) == ("10.0.0.7", 7, False, None)
    binary = pa.table(netfloor.scan(sctp_capture, "chunks", binary_addresses=True, columns=["ip.source"]))
    assert binary["ip_source"][7].as_py() == bytes([10, 0, 0, 7])


def test_readers_take_the_same_rows(sctp_capture: Path) -> None:
    scan = netfloor.scan(sctp_capture, "chunks", where="sctp.tsn < 500", columns=["sctp.tsn", "ip_source", "time"])
    wanted = pa.table(scan)
    assert wanted.num_rows == 500
    assert polars.DataFrame(scan)["sctp_tsn"].to_list() == wanted["sctp_tsn"].to_pylist()
    assert polars.DataFrame(scan)["ip_source"].cast(polars.String).to_list() == wanted["ip_source"].to_pylist()
    assert pandas.DataFrame.from_arrow(scan)["sctp_tsn"].to_list() == wanted["sctp_tsn"].to_pylist()
    assert duckdb.sql("select sctp_tsn, ip_source from scan order by 1").fetchall() == list(
        zip(wanted["sctp_tsn"].to_pylist(), wanted["ip_source"].to_pylist(), strict=True)
    )


def test_schema_needs_no_capture() -> None:
    scan = netfloor.scan("missing.pcap", columns=["ip.ttl", "packet"])
    schema = pa.schema(scan)
    assert schema.names == ["ip_ttl", "packet"]
    assert (schema.field("ip_ttl").nullable, schema.field("packet").nullable) == (True, False)


def test_damage_comes_after_the_rows_before_it(cut_capture: Path) -> None:
    reader = pa.RecordBatchReader.from_stream(netfloor.scan(cut_capture, "chunks"))
    assert reader.read_next_batch().num_rows == 999
    with pytest.raises(OSError, match=f"{cut_capture}: the capture is cut off .* in packet 1000"):
        reader.read_next_batch()


@pytest.mark.parametrize(
    ("arguments", "error", "text"),
    [
        ({"table": "layer"}, ValueError, "packets, layers, chunks, causes"),
        ({"columns": ["sctp.tsn"]}, ValueError, "'sctp.tsn' is no column"),
        ({"columns": []}, ValueError, "at least one"),
        ({"columns": "packet"}, ValueError, "list"),
        ({"where": "ip.tll"}, netfloor.ConditionError, "ip.tll"),
    ],
)
def test_mistakes_are_said_at_once(arguments: dict, error: type[Exception], text: str) -> None:
    with pytest.raises(error, match=text):
        netfloor.scan("missing.pcap", **arguments)


def test_a_missing_capture_is_said_when_it_is_opened() -> None:
    with pytest.raises(netfloor.CaptureError, match="missing.pcap"):
        pa.table(netfloor.scan("missing.pcap"))


def test_threads_read_at_the_same_time(sctp_capture: Path) -> None:
    scan = netfloor.scan(sctp_capture, "chunks")
    rows: list[int] = []
    threads = [threading.Thread(target=lambda: rows.append(pa.table(scan).num_rows)) for _ in range(4)]
    for thread in threads:
        thread.start()
    for thread in threads:
        thread.join()
    assert rows == [1000] * 4


MEMORY = """
import resource, sys
import netfloor, pyarrow as pa
pa.set_memory_pool(pa.system_memory_pool())
before = resource.getrusage(resource.RUSAGE_SELF).ru_maxrss
rows = sum(batch.num_rows for batch in pa.RecordBatchReader.from_stream(netfloor.scan(sys.argv[1], "chunks")))
print(rows, resource.getrusage(resource.RUSAGE_SELF).ru_maxrss - before)
"""


def grown_memory(path: Path) -> tuple[int, int]:
    """Rows, and KiB by which the process grew."""
    output = subprocess.run([sys.executable, "-c", MEMORY, path], check=True, capture_output=True, text=True).stdout
    rows, kib = output.split()
    return int(rows), int(kib)


def test_a_million_packets_need_no_more_memory_than_some(tmp_path: Path) -> None:
    packets = [sctp_packet(tsn) for tsn in range(1000)]
    some = grown_memory(write_pcap(tmp_path / "some.pcap", packets * 150))
    million = grown_memory(write_pcap(tmp_path / "million.pcap", packets * 1000))
    assert (some[0], million[0]) == (150_000, 1_000_000)
    assert million[1] < some[1] + 8192
