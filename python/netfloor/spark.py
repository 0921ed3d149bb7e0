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

A capture FILE with a plan beside it, FILE.plan.json, as `netfloor plan --shards 64 FILE` writes it, is cut as the plan
says. Of a URL, the task of a shard fetches the octets of its shard alone; without a plan it fetches the whole capture.

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
from collections.abc import Iterable, Iterator, Mapping, Sequence
from dataclasses import dataclass
from pathlib import Path
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

from . import CaptureError, Column, ConditionError, Shard, columns, plan, read_plan, scan

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
    paths: list[str]
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
        # load() passes one path as it is, and several as JSON.
        paths = json.loads(options["paths"]) if "paths" in options else [options.get("path", "")]
        if not all(paths):
            raise ValueError("Name the captures: load('captures/*.pcap').")
        if corrupt not in ("fail", "skip"):
            raise ValueError(f"corrupt is 'fail' or 'skip', and not '{corrupt}'.")
        if corrupt == "skip" and not options.get("skipped"):
            raise ValueError("With corrupt=skip, name a folder for the list of what was skipped: option skipped.")
        return _Options(
            paths,
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


_PLAN = ".plan.json"


def _is_url(path: str) -> bool:
    return "://" in path


def _files(path: str) -> list[str]:
    if _is_url(path):
        import fsspec

        files = [str(file.full_name) for file in fsspec.open_files(path)]
    else:
        path = os.path.abspath(path)  # the workers run in other folders
        files = [path] if os.path.isfile(path) else glob.glob(os.path.join(path, "*") if os.path.isdir(path) else path)
    captures = sorted(file for file in files if not file.endswith(_PLAN))
    if not captures:
        raise CaptureError(f"{path}: there is no such capture.")
    return captures


def _planned(file: str) -> list[Shard] | None:
    """The shards of the plan beside a capture, if there is one."""
    if _is_url(file):
        from . import _remote

        text = _remote.read_beside(file, _PLAN)
    else:
        beside = Path(file + _PLAN)
        text = beside.read_bytes() if beside.exists() else None
    if text is None:
        return None
    try:
        shards = read_plan(text)
    except ValueError as error:
        raise ValueError(f"{file}{_PLAN}: {error}") from None
    if len({shard.path for shard in shards}) != 1:
        raise ValueError(f"{file}{_PLAN} is not the plan of one capture. Make it by: netfloor plan {file}")
    return shards


def _openable(partition: "_Partition") -> contextlib.AbstractContextManager[str]:
    """A path at which this process can open the capture."""
    if not _is_url(partition.path):
        return contextlib.nullcontext(partition.path)
    from . import _remote

    return _remote.in_memory(partition.path, partition.shard)


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


def _is_condition(text: str) -> bool:
    # Some columns are none of a layer, such as the name of an interface, and a condition cannot ask for them.
    try:
        scan("", where=text)
    except ConditionError:
        return False
    return True


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
            condition = _condition(filter, known)
            if condition and _is_condition(condition):
                self._conditions.append(condition)
        return filters

    def partitions(self) -> list[_Partition]:
        files = [file for path in self._options.paths for file in _files(path)]
        local = [file for file in files if not _is_url(file)]
        # As many octets for each shard, in however many captures they are.
        octets = math.ceil(sum(map(os.path.getsize, local)) / self._options.shards) if self._options.shards else 0
        return [_Partition(file, shard) for file in files for shard in self._shards(file, octets)]

    def _shards(self, file: str, octets: int) -> Sequence[Shard | None]:
        planned = _planned(file)
        if planned is not None:
            return planned
        if octets == 0 or _is_url(file):
            return [None]
        try:
            return plan(file, shard_octets=octets)
        except CaptureError:
            return [None]  # the task that reads it fails or skips it

    def read(self, partition: _Partition) -> Iterator[pa.RecordBatch]:  # type: ignore[override]
        options = self._options
        where = " and ".join(f"({text})" for text in [options.where, *self._conditions] if text)
        with _openable(partition) as path:
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
    """Makes the format "netfloor" known, and lets filters reach it. Where the workers run, the package is needed, too."""
    spark.conf.set("spark.sql.python.filterPushdown.enabled", "true")  # without it, Spark refuses what takes filters
    spark.dataSource.register(NetfloorDataSource)
