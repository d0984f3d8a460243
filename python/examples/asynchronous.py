"""Prints the HFS paths of its arguments, which are all asked for at once, and how many items of the first have one."""

import asyncio
import os
import sys

from tallowmere import ConversionError, Converted, conversion
from tallowmere.aio import Client


async def hfs_path_of(client: Client, path: str) -> str:
    try:
        return (await client.hfs_path_of(path)).text
    except ConversionError as error:
        return str(error)


async def main(paths: list[str]) -> None:
    async with Client() as client:
        for text in await asyncio.gather(*(hfs_path_of(client, path) for path in paths)):
            print(text)
        items = (conversion.hfs_path_of(entry.path) for entry in os.scandir(paths[0]))
        print(sum([isinstance(answer, Converted) async for answer in client.batch(items)]), "items in", paths[0])


asyncio.run(main(sys.argv[1:]))
