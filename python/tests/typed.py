"""What a type checker has to know of the answers; never run."""

from __future__ import annotations

from typing import AsyncIterator, Iterator, Optional, Union

from tallowmere import (
    Client, ConversionError, Converted, FSSpec, Outcome, ServiceError, Volume, aio, conversion, request,
)  # fmt: skip


def of_threads(client: Client) -> None:
    record: Converted[FSSpec] = client.record_of("/")
    path: str = client.path_of(record.value).value
    hfs_path: bytes = client.hfs_path_of(b"/").value
    outcome: Outcome = client.path_of_hfs_path(hfs_path).outcome
    volumes: list[Volume] = client.volumes()
    raw: Optional[FSSpec] = client.ask(request.get_fsspec("/"))
    asked: Converted[str] = client.ask(conversion.path_of_hfs_path("a:"))
    requests = map(request.get_fsspec, ["/"])
    raws: Iterator[Union[Optional[FSSpec], ServiceError]] = client.batch(requests)
    records: Iterator[Union[Converted[FSSpec], ConversionError, ServiceError]] = client.batch(
        map(conversion.record_of, ["/"])
    )
    del path, outcome, volumes, raw, asked, raws, records


async def of_asyncio(client: aio.Client) -> None:
    record: Converted[FSSpec] = await client.record_of("/")
    raw: Optional[str] = await client.ask(request.add_hfs_name("/", record.value.name))
    records: AsyncIterator[Union[Converted[FSSpec], ConversionError, ServiceError]] = client.batch(
        conversion.record_of(path) for path in ["/"]
    )
    del raw, records
