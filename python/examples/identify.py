import sys
from tallowmere import Client, ConversionError

with Client() as client:
    for path in sys.argv[1:]:
        try:
            record, hfs_path = client.record_of(path), client.hfs_path_of(path)
            print(path, record.outcome.value, record.text, hfs_path.text, sep="\n    ")
        except ConversionError as error:
            print(path, error.outcome.value, error, sep="\n    ")
