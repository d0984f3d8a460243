import os
import sys
from tallowmere import Client, hfs_name_to_str

with Client() as client:
    for path in map(os.path.abspath, sys.argv[1:]):
        spec, place = client.get_fsspec(path), client.make_full_path(path)
        name = spec.name if spec and not os.path.isdir(path) else b""
        print(path, spec, hfs_name_to_str(place + name) if spec else "no HFS path", sep="\n    ")
