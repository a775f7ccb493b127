#!/usr/bin/env python3
"""Describe GeoTIFFs of one band of bytes each as one raster: stackvrt.py [--nodata V] OUTPUT.vrt BAND.tif...

The files have to lie on one grid of a projected reference system. The no-data value is that of the first
file unless stated. The samples are not copied.
"""
import os
import struct
import sys

FORMATS = {1: "B", 2: "s", 3: "H", 4: "I", 11: "f", 12: "d"}
WIDTH, HEIGHT, BITS, SPACING, TIE_POINT, GEO_KEYS, NO_DATA = 256, 257, 258, 33550, 33922, 34735, 42113


def read_tags(path):
    """The tags of the first image of a TIFF, by their numbers."""
    with open(path, "rb") as file:
        data = file.read()
    order = {b"II": "<", b"MM": ">"}.get(data[:2])
    if order is None or struct.unpack_from(order + "H", data, 2) != (42,):
        sys.exit(f"BAND: '{path}' is no TIFF; expected a GeoTIFF")
    (start,) = struct.unpack_from(order + "I", data, 4)
    (entries,) = struct.unpack_from(order + "H", data, start)
    tags = {}
    for entry in range(start + 2, start + 2 + 12 * entries, 12):
        tag, kind, count = struct.unpack_from(order + "HHI", data, entry)
        form = f"{order}{count}{FORMATS.get(kind, 's')}"
        inside = struct.calcsize(form) <= 4
        at = entry + 8 if inside else struct.unpack_from(order + "I", data, entry + 8)[0]
        if at + struct.calcsize(form) <= len(data):
            tags[tag] = struct.unpack_from(form, data, at)
    return tags


def epsg_of(keys):
    """The code of a projected reference system, from a directory of four numbers for each key."""
    for i in range(4, len(keys), 4):
        if keys[i] == 3072:
            return keys[i + 3]
    sys.exit("BAND: no projected reference system; expected one by its EPSG code")


def grid_of(tags):
    (width,), (height,) = tags[WIDTH], tags[HEIGHT]
    dx, dy = tags[SPACING][:2]
    column, row, _, x, y, _ = tags[TIE_POINT][:6]
    return width, height, x - column * dx, dx, y + row * dy, -dy, epsg_of(tags[GEO_KEYS])


def band(number, path, folder, no_data):
    return f"""  <VRTRasterBand dataType="Byte" band="{number}">
    <NoDataValue>{no_data}</NoDataValue>
    <SimpleSource>
      <SourceFilename relativeToVRT="1">{os.path.relpath(path, folder)}</SourceFilename>
      <SourceBand>1</SourceBand>
    </SimpleSource>
  </VRTRasterBand>
"""


def main():
    arguments = sys.argv[1:]
    stated = None
    if len(arguments) > 1 and arguments[0] == "--nodata":
        stated = arguments[1]
        arguments = arguments[2:]
    if len(arguments) < 2:
        sys.exit(__doc__)
    target, *paths = arguments
    all_tags = [read_tags(path) for path in paths]
    grid = grid_of(all_tags[0])
    for path, tags in zip(paths, all_tags):
        if tags[BITS] != (8,):
            sys.exit(f"BAND: '{path}' has samples of {tags[BITS]} bits; expected one band of bytes")
        if grid_of(tags) != grid:
            sys.exit(f"BAND: '{path}' lies on {grid_of(tags)}; expected the grid of '{paths[0]}', {grid}")
    no_data = stated or all_tags[0][NO_DATA][0].decode("ascii").strip("\0 ")
    width, height, west, dx, north, dy, epsg = grid
    with open(target, "w", encoding="utf-8") as file:
        file.write(f"""<VRTDataset rasterXSize="{width}" rasterYSize="{height}">
  <SRS>EPSG:{epsg}</SRS>
  <GeoTransform>{west!r}, {dx!r}, 0, {north!r}, 0, {dy!r}</GeoTransform>
""")
        for number, path in enumerate(paths, 1):
            file.write(band(number, path, os.path.dirname(target) or ".", no_data))
        file.write("</VRTDataset>\n")


main()
