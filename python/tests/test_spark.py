# SPDX-License-Identifier: MIT
"""The data source, on a cluster of a master and two workers."""

import hashlib
import json
import shutil
import threading
import time
from collections.abc import Iterator
from pathlib import Path
from typing import Any

import netfloor
import pyarrow as pa
import pytest
from netfloor import _cluster, spark
from pyspark.sql import DataFrame, SparkSession

from conftest import CAPTURES, sctp_packet, write_pcap, write_plan


@pytest.fixture(scope="module")
def cluster(tmp_path_factory: pytest.TempPathFactory) -> Iterator[_cluster.LocalCluster]:
    with _cluster.LocalCluster(tmp_path_factory.mktemp("cluster")) as cluster:
        yield cluster


@pytest.fixture(scope="module")
def session(cluster: _cluster.LocalCluster) -> Iterator[SparkSession]:
    session = (
        SparkSession.builder.master(cluster.url)
        .config("spark.driver.host", _cluster.HOST)
        .config("spark.executor.memory", "700m")
        .config("spark.sql.session.timeZone", "UTC")
        .config("spark.ui.showConsoleProgress", "false")
        .config("spark.log.level", "ERROR")
        .getOrCreate()
    )
    spark.register(session)
    yield session
    session.stop()


@pytest.fixture(scope="module")
def captures(tmp_path_factory: pytest.TempPathFactory) -> Path:
    folder = tmp_path_factory.mktemp("captures")
    for name in ("a", "b"):
        write_pcap(folder / f"{name}.pcap", [sctp_packet(tsn) for tsn in range(5000)])
    return folder


def load(session: SparkSession, path: Path | str, **options: Any) -> DataFrame:
    return session.read.format("netfloor").options(table="chunks", **options).load(str(path))


def hashed(rows: list[tuple[Any, ...]]) -> tuple[int, str]:
    return len(rows), hashlib.sha256("\n".join(sorted(map(repr, rows))).encode()).hexdigest()


def one_run(folder: Path) -> tuple[int, str]:
    names = ["packet", "time", "ip_source", "sctp_tsn"]
    rows = []
    for path in sorted(folder.glob("*.pcap")):
        table = pa.table(netfloor.scan(path, "chunks", columns=names))
        columns = [table["packet"], table["time"].cast(pa.int64()), table["ip_source"], table["sctp_tsn"]]
        rows += [(str(path), *row) for row in zip(*(column.to_pylist() for column in columns), strict=True)]
    return hashed(rows)


def cluster_run(frame: DataFrame) -> tuple[int, str]:
    return hashed([tuple(row) for row in frame.select("file", "packet", "time_ns", "ip_source", "sctp_tsn").collect()])


@pytest.mark.parametrize("shards", [1, 7, 64])
def test_shards_give_the_rows_of_one_run(session: SparkSession, captures: Path, shards: int) -> None:
    frame = load(session, captures, shards=shards)
    assert abs(frame.rdd.getNumPartitions() - shards) <= 2
    assert cluster_run(frame) == one_run(captures)


def test_types_and_filters(session: SparkSession, captures: Path) -> None:
    frame = load(session, captures / "a.pcap", columns="time,ip.source,sctp_tsn,sctp_unordered")
    types = {"file": "string", "time": "timestamp", "time_ns": "bigint", "ip_source": "string", "sctp_tsn": "bigint"}
    assert dict(frame.dtypes) == {**types, "sctp_unordered": "boolean"}
    found = frame.where("sctp_tsn >= 4000 and ip_source = '10.0.0.7' and not sctp_unordered").orderBy("sctp_tsn")
    assert [row.sctp_tsn for row in found.collect()] == [4007, 4257, 4507, 4757]
    one = frame.where("sctp_tsn = 3")
    row = one.collect()[0]
    read = one._jdf.queryExecution().executedPlan().collectLeaves().apply(0)
    assert read.metrics().apply("numOutputRows").value() == 1  # the rest was left out by the scan
    assert row.time_ns == 1_700_000_000_003_000_003
    assert row.time.microsecond == 3000


def test_paths_hold_in_the_folders_of_the_workers(monkeypatch: pytest.MonkeyPatch) -> None:
    monkeypatch.chdir(CAPTURES)
    reader = spark.NetfloorReader(spark._Options.of({"paths": '["sctp-over-ipv6.pcap", "./tcp-md5-bgp.*"]'}))
    assert [part.path for part in reader.partitions()] == [f"{CAPTURES}/{name}" for name in ("sctp-over-ipv6.pcap", "tcp-md5-bgp.pcap")]


@pytest.mark.parametrize(
    ("table", "name"),
    [
        ("packets", "mixed-pppoe-double-vlan.pcap"),
        ("layers", "tunnel-gre-sample.pcap"),
        ("layers", "sctp-over-ipv6.pcap"),
        ("chunks", "sctp-s1ap-sll.pcapng"),
    ],
)
def test_no_filter_loses_a_row(table: str, name: str) -> None:
    options = spark._Options.of({"path": str(CAPTURES / name), "table": table})

    def rows(*filters: Any) -> list[dict[str, Any]]:
        reader = spark.NetfloorReader(options)
        reader.pushFilters(list(filters))
        return [row for part in reader.partitions() for batch in reader.read(part) for row in batch.to_pylist()]

    whole = rows()
    for column in netfloor.columns(table):
        rows(spark.EqualTo((column.name,), "x"), spark.GreaterThan((column.name,), -1))  # which no condition may say
        values = sorted({row[column.name] for row in whole if row[column.name] is not None})
        for value in values[:3]:
            wanted = [row for row in whole if row[column.name] == value]
            for filter in (spark.EqualTo((column.name,), value), spark.In((column.name,), (value,))):
                assert [row for row in rows(filter) if row[column.name] == value] == wanted


def test_urls_with_and_without_a_plan(session: SparkSession, captures: Path, tmp_path: Path) -> None:
    planned = Path(shutil.copy(captures / "a.pcap", tmp_path))
    write_plan(planned, 3)
    frame = session.read.format("netfloor").option("table", "chunks").load([f"file://{captures}/b.pcap", f"file://{tmp_path}/*"])
    assert frame.rdd.getNumPartitions() == 4
    assert frame.groupBy("file").count().orderBy("file").collect() == sorted(
        (f"file://{path}", 5000) for path in (captures / "b.pcap", planned)
    )


def test_a_corrupt_capture_fails_or_is_listed(session: SparkSession, captures: Path, tmp_path: Path) -> None:
    cut = tmp_path / "cut.pcap"
    cut.write_bytes((captures / "a.pcap").read_bytes()[:-3])
    (tmp_path / "none.pcap").write_bytes(b"no capture")
    with pytest.raises(Exception, match="none.pcap|cut.pcap"):
        load(session, tmp_path / "*.pcap").count()
    assert load(session, tmp_path / "*.pcap", corrupt="skip", skipped=tmp_path / "skipped").count() == 4999
    listed = [json.loads(path.read_text()) for path in (tmp_path / "skipped").iterdir()]
    assert sorted(entry["file"] for entry in listed) == [str(cut), str(tmp_path / "none.pcap")]
    assert any("in packet 5000" in entry["error"] for entry in listed)


# The last one: the cluster has one worker less after it.
def test_a_killed_worker_costs_no_row(
    cluster: _cluster.LocalCluster, session: SparkSession, captures: Path
) -> None:
    found: list[tuple[int, str]] = []
    slow = session.udf.register("slow", lambda tsn: time.sleep(0.0002) or tsn, "long")
    frame = load(session, captures, shards=40).withColumn("sctp_tsn", slow("sctp_tsn"))
    job = threading.Thread(target=lambda: found.append(cluster_run(frame)))
    job.start()
    tracker = session.sparkContext.statusTracker()

    def completed() -> int:
        stages = [tracker.getStageInfo(stage) for stage in tracker.getActiveStageIds()]
        return sum(stage.numCompletedTasks for stage in stages if stage)

    end = time.monotonic() + 60
    while completed() < 4 and job.is_alive() and time.monotonic() < end:
        time.sleep(0.02)
    assert job.is_alive()  # in the middle of the work
    cluster.kill_worker()
    job.join(240)
    assert found == [one_run(captures)]
