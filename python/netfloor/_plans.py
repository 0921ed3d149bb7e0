# SPDX-License-Identifier: MIT
"""Plans that the command has written."""

import json
from typing import Any

from ._netfloor import Shard

_VERSION = 1


def read_plan(text: str | bytes) -> list[Shard]:
    """The shards of a plan, which is the JSON that `netfloor plan` writes.

        for shard in netfloor.read_plan(Path("plan.json").read_bytes()):
            netfloor.scan(shard.path, shard=shard)

    Raises ValueError for what is no plan.
    """
    try:
        plan = json.loads(text)
        if plan["plan_version"] != _VERSION:
            raise ValueError("The plan is of another version. Plan the captures again.")
        return [_shard(row, plan["captures"][row["capture"]]) for row in plan["shards"]]
    except (KeyError, IndexError, TypeError, json.JSONDecodeError) as error:
        raise ValueError(f"This is no plan: {error!r}.") from None


def _shard(row: dict[str, Any], capture: dict[str, Any]) -> Shard:
    file = (
        capture["file"],
        capture["octets"],
        capture["modified_ns"],
        bytes.fromhex(capture["start"]),
        capture["packed"],
        capture["damage"] or "",
    )
    sections = [(section["begin"], section["interfaces"]) for section in capture["sections"]]
    first = row["first_time"]
    time = (first["seconds"], first["nanoseconds"]) if first else None
    place = (row["begin"], row["first_packet"] - 1, row["section"], row["interfaces"])
    shard = Shard.__new__(Shard)
    shard.__setstate__((file, sections, (*place, row["end"], row["packets"], time)))
    return shard
