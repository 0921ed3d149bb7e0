# SPDX-License-Identifier: MIT
"""Shards in this process and under Dask."""

import pickle
from pathlib import Path

import dask.dataframe
import netfloor
import pandas
import pyarrow as pa
import pytest

from conftest import CAPTURES, write_plan


def rows(shard: netfloor.Shard) -> pandas.DataFrame:
    return pa.table(netfloor.scan(shard.path, "chunks", columns=["packet", "sctp_tsn"], shard=shard)).to_pandas()


@pytest.mark.parametrize("name", ["sctp-s1ap-sll.pcapng", "pcapng-big-endian-two-interfaces.pcapng", "tunnel-gre-sample.pcap"])
def test_pickled_shards_have_the_rows_of_the_capture(name: str) -> None:
    shards = pickle.loads(pickle.dumps(netfloor.plan(CAPTURES / name, 7)))
    assert len(shards) > 2
    for table in ("packets", "layers"):
        parts = [pa.table(netfloor.scan(shard.path, table, shard=shard)) for shard in shards]
        assert [part.num_rows for part in parts if table == "packets"] in ([], [shard.packets for shard in shards])
        whole = pa.table(netfloor.scan(CAPTURES / name, table))
        assert pa.concat_tables(parts).to_pylist() == whole.to_pylist()


def test_a_changed_capture_is_refused(sctp_capture: Path) -> None:
    shard = netfloor.plan(sctp_capture, 4)[2]
    assert (shard.first_packet, shard.path) == (sum(s.packets for s in netfloor.plan(sctp_capture, 4)[:2]) + 1, str(sctp_capture))
    sctp_capture.write_bytes(sctp_capture.read_bytes() + b"x")
    with pytest.raises(netfloor.CaptureError, match="planned"):
        pa.table(netfloor.scan(shard.path, "chunks", shard=shard))
    with pytest.raises(ValueError, match="either"):
        netfloor.plan(sctp_capture)


def test_dask_reads_a_shard_a_partition(sctp_capture: Path) -> None:
    frame = dask.dataframe.from_map(rows, netfloor.plan(sctp_capture, 7))
    assert frame.npartitions == 7
    assert frame["sctp_tsn"].sum().compute(scheduler="processes", num_workers=2) == sum(range(1000))


def test_a_plan_of_the_command_has_the_same_shards(tmp_path: Path) -> None:
    capture = CAPTURES / "pcapng-big-endian-two-interfaces.pcapng"
    found = netfloor.read_plan(write_plan(capture, 3, tmp_path / "plan.json").read_bytes())
    assert [pickle.dumps(shard) for shard in found] == [pickle.dumps(shard) for shard in netfloor.plan(capture, 3)]
    for text in ("{", "{}", '{"plan_version": 2}', '{"plan_version": 1, "captures": [], "shards": [{"capture": 0}]}'):
        with pytest.raises(ValueError, match="plan"):
            netfloor.read_plan(text)
