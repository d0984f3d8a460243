"""The volumes, which the protocol has no request for."""

from __future__ import annotations

import os
from typing import Dict, List, NamedTuple

from . import request
from ._mounts import read_mounts
from ._wire import hfs_name_to_str
from .conversion import PARENT_OF_ROOTS
from .request import Plan, Planned


class Volume(NamedTuple):
    """number: volume reference number. name: in Mac Roman; not unique. mount_point: the path of its root folder."""

    number: int
    name: bytes
    mount_point: str

    @property
    def name_text(self) -> str:
        return hfs_name_to_str(self.name)


def list_volumes() -> Planned[List[Volume]]:
    """The records of all mount points: a parent id of 1 tells the root folder of a volume."""

    def plan() -> Plan[List[Volume]]:
        points = [mount.point for mount in read_mounts()]
        specs = yield [request.get_fsspec(point) for point in points]
        volumes: Dict[int, Volume] = {}
        for point, spec in zip(points, specs):
            if spec is not None and spec.par_id == PARENT_OF_ROOTS:
                volumes.setdefault(spec.v_ref_num, Volume(spec.v_ref_num, spec.name, os.fsdecode(point)))
        return list(volumes.values())

    return Planned(plan)
