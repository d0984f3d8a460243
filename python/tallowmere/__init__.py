"""Asks Tallowmere, the helper process that knows the legacy identities of files."""

from . import request
from ._client import Client, DeadlineMissed, ProtocolError, ServiceEnded, ServiceError
from ._wire import FSSpec, hfs_name_from_str, hfs_name_to_str
from .request import ExportSettings, Request

__all__ = [
    "Client", "DeadlineMissed", "ExportSettings", "FSSpec", "ProtocolError", "Request", "ServiceEnded", "ServiceError",
    "hfs_name_from_str", "hfs_name_to_str", "request",
]  # fmt: skip
