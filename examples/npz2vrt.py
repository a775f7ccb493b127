#!/usr/bin/env python3
"""Makes an elevation model that GDAL reads out of a numpy archive, with the standard library alone.

usage: npz2vrt.py ARCHIVE.npz OUTPUT.vrt

The archive holds `elevation`, 16-bit integers from north to south, and in degrees the cell sizes `dx` and
`dy` and the borders `xmin`, `ymin` and `ymax`. The samples go to OUTPUT.bin beside the description.
"""
import ast
import os
import struct
import sys
import zipfile


def read_array(archive, name):
    """The header and the raw bytes of one array of the archive."""
    raw = archive.read(name + ".npy")
    (length,) = struct.unpack_from("<H", raw, 8)
    return ast.literal_eval(raw[10:10 + length].decode("latin-1")), raw[10 + length:]


def read_number(archive, name):
    return struct.unpack("<d", read_array(archive, name)[1])[0]


def main():
    if len(sys.argv) != 3:
        sys.exit(__doc__)
    source, target = sys.argv[1:]
    samples = os.path.splitext(target)[0] + ".bin"
    with zipfile.ZipFile(source) as archive:
        header, data = read_array(archive, "elevation")
        if header["descr"] != "<i2" or header["fortran_order"]:
            sys.exit(f"ARCHIVE: elevation is {header}; expected rows of little-endian 16-bit integers")
        height, width = header["shape"]
        dx, dy, west = (read_number(archive, name) for name in ("dx", "dy", "xmin"))
        north = max(read_number(archive, name) for name in ("ymin", "ymax"))
    with open(samples, "wb") as file:
        file.write(data)
    with open(target, "w", encoding="ascii") as file:
        file.write(f"""<VRTDataset rasterXSize="{width}" rasterYSize="{height}">
  <SRS>EPSG:4326</SRS>
  <GeoTransform>{west!r}, {dx!r}, 0, {north!r}, 0, {-dy!r}</GeoTransform>
  <VRTRasterBand dataType="Int16" band="1" subClass="VRTRawRasterBand">
    <SourceFilename relativeToVRT="1">{os.path.basename(samples)}</SourceFilename>
    <PixelOffset>2</PixelOffset>
    <LineOffset>{2 * width}</LineOffset>
    <ByteOrder>LSB</ByteOrder>
  </VRTRasterBand>
</VRTDataset>
""")


main()
