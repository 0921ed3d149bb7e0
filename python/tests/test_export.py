# SPDX-License-Identifier: MIT
"""The columns against the database that `netfloor export` writes of the same captures."""

import sqlite3
import subprocess
from collections.abc import Iterator
from pathlib import Path
from typing import Any

import netfloor
import pyarrow as pa
import pyarrow.parquet
import pytest

from conftest import ABORT, COMMAND, captures, sctp_packet, write_pcap

TABLES = ["packets", "layers", "chunks", "causes"]


@pytest.fixture(scope="module")
def database(tmp_path_factory: pytest.TempPathFactory) -> Iterator[sqlite3.Connection]:
    folder = tmp_path_factory.mktemp("export")
    path = folder / "traffic.db"
    # What no capture of the repository has: a chunk that was sent twice, and a cause.
    packets = [sctp_packet(1), sctp_packet(1), sctp_packet(2, ABORT)]
    mine = write_pcap(folder / "abort.pcap", packets)
    subprocess.run([COMMAND, "export", "--to", path, *captures(), mine], check=True, capture_output=True)
    connection = sqlite3.connect(path)
    yield connection
    connection.close()


def numbered(database: sqlite3.Connection) -> list[tuple[int, str]]:
    return database.execute("SELECT capture, file FROM captures ORDER BY capture").fetchall()


def as_in_sql(table: pa.Table) -> list[tuple[Any, ...]]:
    """SQLite has neither times nor booleans."""
    columns = []
    for column in table.columns:
        is_number = pa.types.is_timestamp(column.type) or pa.types.is_boolean(column.type)
        columns.append((column.cast(pa.int64()) if is_number else column).to_pylist())
    return list(zip(*columns, strict=True))


@pytest.mark.parametrize("table", TABLES)
def test_parquet_has_the_rows_of_export(database: sqlite3.Connection, table: str, tmp_path: Path) -> None:
    names = ", ".join(column.name for column in netfloor.columns(table))
    rows = 0
    for capture, path in numbered(database):
        reader = pa.RecordBatchReader.from_stream(netfloor.scan(path, table))
        with pa.parquet.ParquetWriter(tmp_path / "table.parquet", reader.schema) as out:
            for batch in reader:
                batch.validate(full=True)
                out.write_batch(batch)
        found = as_in_sql(pa.parquet.read_table(tmp_path / "table.parquet"))
        assert found == database.execute(f"SELECT {names} FROM {table} WHERE capture = ? ORDER BY rowid", [capture]).fetchall()
        rows += len(found)
    assert rows > 0

