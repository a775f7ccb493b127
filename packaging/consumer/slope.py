"""The slope of a small surface, one value a line. slope.cpp prints the same lines."""

import numpy as np

import gridmill

y, x = np.mgrid[0:7, 0:7]
elevation = (x * x + 3 * y - x * y).astype(np.float32)
for value in gridmill.slope(elevation, cellsize=(30, 25), margin=1).ravel():
    print(f"{value:.9g}")
