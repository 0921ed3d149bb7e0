# SPDX-License-Identifier: MIT
"""A data source for Spark 4.1 or newer.

    netfloor.spark.register(spark)
    chunks = spark.read.format("netfloor").option("table", "chunks").load("captures/*.pcap")

Options:

    table      packets, layers (by default), chunks or causes
    columns    names with commas between them; all by default
    where      a condition, as netfloor.scan takes it
    shards     into how many tasks the captures are cut, about; by default a task is a capture
    corrupt    fail (by default), or skip: the rows in front of a damage are kept, and the capture is listed
    skipped    the folder of that list, a JSON file for each capture; all workers must reach it

Each row has the name of its capture in the column file. Types that Spark lacks become wider or plain: unsigned numbers
the next signed ones, addresses strings, time microseconds, with all its nanoseconds in time_ns.
"""

import contextlib
import glob
import hashlib
import ipaddress
import json
import math
import os
from collections.abc import Iterable, Iterator, Mapping
from dataclasses import dataclass
from typing import Any

import pyarrow as pa
from pyspark.sql import SparkSession
from pyspark.sql.datasource import (
    DataSource,
    DataSourceReader,
    EqualTo,
    Filter,
    GreaterThan,
    GreaterThanOrEqual,
    In,
    InputPartition,
    IsNotNull,
    LessThan,
    LessThanOrEqual,
)
from pyspark.sql.types import (
    BinaryType,
    BooleanType,
    DataType,
    IntegerType,
    LongType,
    ShortType,
    StringType,
    StructField,
    StructType,
    TimestampType,
)

from . import CaptureError, Column, Shard, columns, plan, scan

# By the types of netfloor.columns(). A packet's number is the only u64.
_TYPES: dict[str, tuple[DataType, pa.DataType]] = {
    "boolean": (BooleanType(), pa.bool_()),
    "u8": (ShortType(), pa.int16()),
    "u16": (IntegerType(), pa.int32()),
    "u32": (LongType(), pa.int64()),
    "u64": (LongType(), pa.int64()),
    "time": (TimestampType(), pa.timestamp("us", "UTC")),
    "address": (StringType(), pa.string()),
    "text": (StringType(), pa.string()),
    "octets": (BinaryType(), pa.binary()),
}
_NUMBERS = ("u8", "u16", "u32")
_MOST = 2**32 - 1  # of the numbers in a condition


@dataclass(frozen=True)
class _Options:
    path: str
    table: str
    columns: list[str] | None
    where: str
    shards: int
    skips: bool
    skipped: str

    @staticmethod
    def of(options: Mapping[str, str]) -> "_Options":
        names = [name.strip() for name in options.get("columns", "").split(",") if name.strip()]
        corrupt = options.get("corrupt", "fail")
        if "path" not in options:
            raise ValueError("Name the captures: load('captures/*.pcap').")
        if corrupt not in ("fail", "skip"):
            raise ValueError(f"corrupt is 'fail' or 'skip', and not '{corrupt}'.")
        if corrupt == "skip" and not options.get("skipped"):
            raise ValueError("With corrupt=skip, name a folder for the list of what was skipped: option skipped.")
        return _Options(
            options["path"],
            options.get("table", "layers"),
            names or None,
            options.get("where", ""),
            int(options.get("shards", "0")),
            corrupt == "skip",
            options.get("skipped", ""),
        )

    def wanted(self) -> list[Column]:
        known = {name: column for column in columns(self.table) for name in (column.name, column.field)}
        scan("", self.table, columns=self.columns, where=self.where)  # says what has no meaning
        return [known[name] for name in self.columns] if self.columns else columns(self.table)


@dataclass(frozen=True)
class _Partition(InputPartition):
    path: str
    shard: Shard | None = None


def _is_url(path: str) -> bool:
    return "://" in path


def _files(path: str) -> list[str]:
    if _is_url(path):
        import fsspec

        files = [str(file.full_name) for file in fsspec.open_files(path)]
    else:
        files = [path] if os.path.isfile(path) else glob.glob(os.path.join(path, "*") if os.path.isdir(path) else path)
    if not files:
        raise CaptureError(f"{path}: there is no such capture.")
    return sorted(files)


@contextlib.contextmanager
def _local(path: str) -> Iterator[str]:
    """A path that can be opened here: of a URL, its octets in memory."""
    if not _is_url(path):
        yield path
        return
    import fsspec

    memory = os.memfd_create("netfloor")
    try:
        with fsspec.open(path, "rb") as remote:
            while piece := remote.read(1 << 22):
                os.write(memory, piece)
        yield f"/proc/self/fd/{memory}"
    finally:
        os.close(memory)


def _condition(filter: Filter, known: dict[str, Column]) -> str | None:
    """A condition that holds for all rows that pass the filter, or None."""
    column = known.get(".".join(getattr(filter, "attribute", ())))
    if column is None or "." not in column.field:
        return None
    if isinstance(filter, IsNotNull):
        return f"{column.field} >= 0" if column.type in _NUMBERS else None
    if isinstance(filter, In):
        values = [_value(value, column) for value in filter.value]
        if not values or None in values or column.type == "boolean":
            return None
        return f"{column.field} in {{{', '.join(str(value) for value in values)}}}"
    operators = {EqualTo: "==", GreaterThan: ">", GreaterThanOrEqual: ">=", LessThan: "<", LessThanOrEqual: "<="}
    operator = operators.get(type(filter))
    if operator is None:
        return None
    value = _value(filter.value, column)  # type: ignore[attr-defined]
    if value is None or (operator != "==" and column.type not in _NUMBERS):
        return None
    if column.type == "boolean":
        return column.field if value == "1" else f"{column.field} == 0"
    return f"{column.field} {operator} {value}"


def _value(value: Any, column: Column) -> str | None:
    if column.type == "boolean":
        return str(int(value)) if isinstance(value, bool) else None
    if column.type in _NUMBERS:
        return str(value) if isinstance(value, int) and 0 <= value <= _MOST else None
    if column.type == "address" and isinstance(value, str):
        with contextlib.suppress(ValueError):
            return str(ipaddress.ip_address(value))
    return None


class NetfloorReader(DataSourceReader):
    def __init__(self, options: _Options) -> None:
        self._options = options
        self._columns = options.wanted()
        self._conditions: list[str] = []

    def pushFilters(self, filters: list[Filter]) -> Iterable[Filter]:
        """All filters are still Spark's: a condition may let more rows through, but never fewer."""
        known = {column.name: column for column in columns(self._options.table)}
        for filter in filters:
            if condition := _condition(filter, known):
                self._conditions.append(condition)
        return filters

    def partitions(self) -> list[_Partition]:
        files = _files(self._options.path)
        local = [file for file in files if not _is_url(file)]
        if self._options.shards == 0 or not local:
            return [_Partition(file) for file in files]
        octets = max(1, math.ceil(sum(os.path.getsize(file) for file in local) / self._options.shards))
        return [part for file in files for part in self._shards(file, octets)]

    def _shards(self, file: str, octets: int) -> list[_Partition]:
        if _is_url(file):
            return [_Partition(file)]
        try:
            return [_Partition(file, shard) for shard in plan(file, shard_octets=octets)]
        except CaptureError:
            return [_Partition(file)]  # the task that reads it fails or skips it

    def read(self, partition: _Partition) -> Iterator[pa.RecordBatch]:  # type: ignore[override]
        options = self._options
        where = " and ".join(f"({text})" for text in [options.where, *self._conditions] if text)
        with _local(partition.path) as path:
            try:
                rows = scan(path, options.table, where=where, columns=options.columns, shard=partition.shard)
                for batch in pa.RecordBatchReader.from_stream(rows):
                    yield self._converted(batch, partition.path)
            except OSError as error:
                message = str(error).replace(path, partition.path)
                if not options.skips:
                    raise CaptureError(message) from None
                self._list(partition.path, message)

    def _converted(self, batch: pa.RecordBatch, path: str) -> pa.RecordBatch:
        arrays: list[pa.Array] = [pa.repeat(path, batch.num_rows)]
        names = ["file"]
        for column, array in zip(self._columns, batch.columns, strict=True):
            arrays.append(array.cast(_TYPES[column.type][1], safe=column.type != "time"))
            names.append(column.name)
            if column.type == "time":
                arrays.append(array.cast(pa.int64()))
                names.append("time_ns")
        return pa.RecordBatch.from_arrays(arrays, names=names)

    def _list(self, path: str, message: str) -> None:
        # One name for all tries of a task: the last one stays.
        name = hashlib.sha256(path.encode()).hexdigest()[:16] + ".json"
        text = json.dumps({"file": path, "error": message}) + "\n"
        folder = self._options.skipped
        if _is_url(folder):
            import fsspec

            with fsspec.open(f"{folder.rstrip('/')}/{name}", "w") as out:
                out.write(text)
            return
        os.makedirs(folder, exist_ok=True)
        whole = os.path.join(folder, f".{name}.{os.getpid()}")
        with open(whole, "w", encoding="utf-8") as out:
            out.write(text)
        os.replace(whole, os.path.join(folder, name))


class NetfloorDataSource(DataSource):
    @classmethod
    def name(cls) -> str:
        return "netfloor"

    def schema(self) -> StructType:
        fields = [StructField("file", StringType())]
        for column in _Options.of(self.options).wanted():
            fields.append(StructField(column.name, _TYPES[column.type][0]))
            if column.type == "time":
                fields.append(StructField("time_ns", LongType()))
        return StructType(fields)

    def reader(self, schema: StructType) -> DataSourceReader:
        return NetfloorReader(_Options.of(self.options))


def register(spark: SparkSession) -> None:
    """Makes the format "netfloor" known. The package must be installed where the workers run, too."""
    spark.dataSource.register(NetfloorDataSource)
