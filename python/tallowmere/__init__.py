"""Asks Tallowmere, the helper process that knows the legacy identities of files."""

from . import conversion, request
from ._client import Client
from ._outcome import ConversionError, Converted, Outcome, ServiceError
from ._process import DeadlineMissed, ProtocolError, ServiceEnded
from ._volumes import Volume
from ._wire import FSSpec, hfs_name_from_str, hfs_name_to_str
from .conversion import Conversion
from .request import ExportSettings, Request

__version__ = "0.1.0"

__all__ = [
    "Client", "Conversion", "ConversionError", "Converted", "DeadlineMissed", "ExportSettings", "FSSpec", "Outcome",
    "ProtocolError", "Request", "ServiceEnded", "ServiceError", "Volume", "conversion", "hfs_name_from_str",
    "hfs_name_to_str", "request",
]  # fmt: skip
