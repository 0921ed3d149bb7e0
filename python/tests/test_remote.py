# SPDX-License-Identifier: MIT
"""Captures behind URLs, of a server on this machine."""

import functools
import http.server
import shutil
import threading
from collections.abc import Iterator
from pathlib import Path

import netfloor
import pyarrow as pa
import pytest
from netfloor import spark

from conftest import CAPTURES, sctp_packet, write_pcap, write_plan


class Server(http.server.ThreadingHTTPServer):
    url = ""
    gives_ranges = True
    served = 0  # octets of captures


class Handler(http.server.SimpleHTTPRequestHandler):
    server: Server

    def do_GET(self) -> None:
        path = Path(self.translate_path(self.path))
        wanted = self.headers.get("Range")
        if not path.is_file() or wanted is None or not self.server.gives_ranges:
            super().do_GET()
            return
        first, last = map(int, wanted.removeprefix("bytes=").split("-"))
        octets = path.read_bytes()[first : last + 1]
        self.server.served += len(octets)
        self.send_response(206)
        self.send_header("Content-Length", str(len(octets)))
        self.send_header("Content-Range", f"bytes {first}-{last}/{path.stat().st_size}")
        self.end_headers()
        self.wfile.write(octets)

    def log_message(self, *_: object) -> None:
        pass


@pytest.fixture
def server(tmp_path: Path) -> Iterator[Server]:
    with Server(("127.0.0.1", 0), functools.partial(Handler, directory=str(tmp_path))) as server:
        server.url = f"http://127.0.0.1:{server.server_port}"
        thread = threading.Thread(target=server.serve_forever)
        thread.start()
        yield server
        server.shutdown()
        thread.join()


def reader(url: str) -> spark.NetfloorReader:
    return spark.NetfloorReader(spark._Options.of({"path": url, "table": "packets"}))


def rows(url: str, shard: int | None = None) -> list[dict[str, object]]:
    partitions = reader(url).partitions()
    chosen = partitions if shard is None else [partitions[shard]]
    return [row for part in chosen for batch in reader(url).read(part) for row in batch.select(["packet", "time_ns"]).to_pylist()]


def rows_of_file(path: Path) -> list[dict[str, object]]:
    table = pa.table(netfloor.scan(path, "packets", columns=["packet", "time"]))
    return [{"packet": packet, "time_ns": time} for packet, time in zip(table["packet"].to_pylist(), table["time"].cast(pa.int64()).to_pylist(), strict=True)]


@pytest.mark.parametrize(
    "name", ["pcapng-big-endian-two-interfaces.pcapng", "sctp-s1ap-sll.pcapng", "tunnel-gre-sample.pcap"]
)
def test_shards_of_a_url_have_the_rows_of_the_file(server: Server, tmp_path: Path, name: str) -> None:
    path = Path(shutil.copy(CAPTURES / name, tmp_path))
    url = f"{server.url}/{name}"
    assert len(reader(url).partitions()) == 1
    write_plan(path, 5)
    assert len(reader(url).partitions()) > 2
    assert rows(url) == rows_of_file(path)


def test_a_shard_fetches_its_range_alone(server: Server, tmp_path: Path) -> None:
    path = write_pcap(tmp_path / "a.pcap", [sctp_packet(tsn) for tsn in range(20_000)])
    write_plan(path, 10)
    found = rows(f"{server.url}/a.pcap", shard=4)
    assert found == rows_of_file(path)[found[0]["packet"] - 1 :][: len(found)]
    assert 1900 < len(found) < 2100
    assert server.served < path.stat().st_size / 10 + 8192


def test_what_was_not_planned_is_refused(server: Server, tmp_path: Path) -> None:
    path = write_pcap(tmp_path / "a.pcap", [sctp_packet(tsn) for tsn in range(100)])
    plan = write_plan(path, 3)
    url = f"{server.url}/a.pcap"
    server.gives_ranges = False
    with pytest.raises(netfloor.CaptureError, match=f"{url}: octets 0 to .* were asked for"):
        rows(url)
    server.gives_ranges = True
    path.write_bytes(path.read_bytes() + b"x")
    with pytest.raises(netfloor.CaptureError, match=f"{url} is not what it was when it was planned"):
        rows(url)
    plan.write_text("{}")
    with pytest.raises(ValueError, match=f"{url}.plan.json: .* no plan"):
        rows(url)
