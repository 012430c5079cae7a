#!/usr/bin/env python3
"""Takes the day out of a type library on which widl made it: once as text, once as a number behind that. The same
definition then makes the same bytes."""

import pathlib
import re
import struct
import sys
import time

path = pathlib.Path(sys.argv[1])
data = bytearray(path.read_bytes())
made = re.search(rb"Created by WIDL version [\d.]+ at (\w{3} \w{3} [ \d]\d [\d:]{8} \d{4})", data)
if not made:
    sys.exit(f"{path} does not say when it was made")
data[made.start(1) : made.end(1)] = b"Thu Jan  1 00:00:00 1970"
numbers = [
    at
    for at in range(made.end(), made.end() + 16)
    if abs(struct.unpack_from("<I", data, at)[0] - time.time()) < 86400
]
if len(numbers) != 1:
    sys.exit(f"{path} has no number of its day")
struct.pack_into("<I", data, numbers[0], 0)
path.write_bytes(data)
