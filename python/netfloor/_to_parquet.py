# SPDX-License-Identifier: MIT
"""Writes a table of captures as Parquet, by a Spark cluster on this machine: what ./spark runs."""

import argparse
import os
import re
import shutil
import sys
import tempfile
from pathlib import Path

from pyspark.errors import PySparkException
from pyspark.sql import SparkSession

from . import _cluster, spark


def main() -> None:
    parser = argparse.ArgumentParser(prog="./spark", description="Writes a table of captures as Parquet.")
    parser.add_argument("captures", nargs="+", metavar="FILE", help="captures that can be read several times")
    parser.add_argument("--table", default="layers", help="packets, layers (default), chunks or causes")
    parser.add_argument("--to", default="netfloor.parquet", metavar="FOLDER", help="must not exist (default: %(default)s)")
    parser.add_argument("--columns", default="", help="names with commas between them (default: all)")
    parser.add_argument("--where", default="", help="a condition, as in netfloor --where")
    parser.add_argument("--workers", type=int, default=max(2, os.cpu_count() or 2), help="default: one a core")
    parser.add_argument("--keep", action="store_true", help="keep the dashboard until Enter is pressed")
    options = parser.parse_args()
    if os.path.exists(options.to):
        parser.error(f"{options.to} exists already. Name another folder with --to.")

    with tempfile.TemporaryDirectory() as folder, _cluster.LocalCluster(Path(folder), options.workers) as cluster:
        print(f"Dashboard of the cluster: {cluster.dashboard}", flush=True)
        session = (
            SparkSession.builder.master(cluster.url)
            .appName("netfloor")
            .config("spark.driver.host", _cluster.HOST)
            .config("spark.ui.showConsoleProgress", "false")
            .config("spark.log.level", "OFF")  # what fails is told below, in a line
            .getOrCreate()
        )
        print(f"Dashboard of this job: {session.sparkContext.uiWebUrl}", flush=True)
        try:
            _write(session, options)
        except PySparkException as error:
            shutil.rmtree(options.to, ignore_errors=True)  # what Spark has begun
            sys.exit(f"./spark: {_reason(error)}")
        finally:
            if options.keep:
                input("Press Enter to end the cluster. ")
            session.stop()


def _write(session: SparkSession, options: argparse.Namespace) -> None:
    spark.register(session)
    folder = os.path.abspath(options.to)
    (
        session.read.format("netfloor")
        .option("table", options.table)
        .option("columns", options.columns)
        .option("where", options.where)
        .option("shards", str(4 * options.workers))
        .load(options.captures)
        .write.parquet(folder)
    )
    print(f"{options.to}: {session.read.parquet(folder).count()} rows", flush=True)


def _reason(error: PySparkException) -> str:
    """The sentence of the package among the frames of Java and Python, if there is one."""
    text = str(error)
    found = re.findall(r"^(?:netfloor\.[\w.]+|ValueError): (.+)$", text, re.MULTILINE)
    return str(found[-1]) if found else text


if __name__ == "__main__":
    main()
