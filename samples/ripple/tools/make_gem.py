#!/usr/bin/env python3
"""Writes assets-src/gem.obj, the ripple sample's faceted gem (a development aid;
the OBJ itself is kept in the repository and converted at build time).

A round brilliant-like cut, y up: an octagonal table, a crown of star, kite
and upper-girdle facets, a thin girdle band and a pavilion of sixteen facets
meeting at the culet. Every facet has its own flat normal; texture
coordinates are cylindrical (s = angle / 2pi, t = height, 1 at the top)."""

import math
import os

TABLE_Y, STAR_Y, GIRDLE_TOP, GIRDLE_BOTTOM, PAVILION_Y, CULET_Y = 0.44, 0.28, 0.05, -0.05, -0.52, -0.98


def ring(count, radius, y, offset=0.0):
    return [(radius * math.cos(2 * math.pi * (i + offset) / count), y,
             radius * math.sin(2 * math.pi * (i + offset) / count)) for i in range(count)]


table = ring(8, 0.55, TABLE_Y)
star = ring(8, 0.78, STAR_Y, 0.5)
upper = ring(16, 1.0, GIRDLE_TOP)
lower = ring(16, 1.0, GIRDLE_BOTTOM)
pavilion = ring(8, 0.52, PAVILION_Y, 0.5)
table_centre = (0.0, TABLE_Y, 0.0)
culet = (0.0, CULET_Y, 0.0)

triangles = []
for i in range(8):
    j = (i + 1) % 8
    triangles.append((table_centre, table[i], table[j]))              # table
    triangles.append((table[i], star[i], table[j]))                   # star facet
    triangles.append((table[i], upper[2 * i], star[i]))               # kite, first half
    triangles.append((table[j], star[i], upper[(2 * i + 2) % 16]))    # kite of the next corner
    triangles.append((star[i], upper[2 * i], upper[2 * i + 1]))       # upper girdle facets
    triangles.append((star[i], upper[2 * i + 1], upper[(2 * i + 2) % 16]))
for k in range(16):
    m = (k + 1) % 16
    triangles.append((upper[k], lower[k], lower[m]))                  # girdle band
    triangles.append((upper[k], lower[m], upper[m]))
for i in range(8):
    a, b, c = lower[2 * i], lower[2 * i + 1], lower[(2 * i + 2) % 16]
    triangles.append((a, b, pavilion[i]))                             # lower girdle facets
    triangles.append((b, c, pavilion[i]))
    triangles.append((c, pavilion[(i + 1) % 8], pavilion[i]))         # pavilion mains
    triangles.append((pavilion[i], pavilion[(i + 1) % 8], culet))


def sub(a, b):
    return (a[0] - b[0], a[1] - b[1], a[2] - b[2])


def cross(a, b):
    return (a[1] * b[2] - a[2] * b[1], a[2] * b[0] - a[0] * b[2], a[0] * b[1] - a[1] * b[0])


def dot(a, b):
    return a[0] * b[0] + a[1] * b[1] + a[2] * b[2]


def uv(p):
    s = (math.atan2(p[2], p[0]) / (2 * math.pi)) % 1.0
    t = (p[1] - CULET_Y) / (TABLE_Y - CULET_Y)
    return (s, t)


lines = ["# Faceted gem for the ripple sample, written by tools/make_gem.py.",
         "# Flat normals per facet, cylindrical texture coordinates.", "o gem"]
faces = []
vertex = normal = 0
for tri in triangles:
    n = cross(sub(tri[1], tri[0]), sub(tri[2], tri[0]))
    centroid = tuple(sum(p[c] for p in tri) / 3 for c in range(3))
    # The gem is convex around the origin: outward means away from it.
    if dot(n, centroid) < 0:
        tri = (tri[0], tri[2], tri[1])
        n = (-n[0], -n[1], -n[2])
    length = math.sqrt(dot(n, n))
    lines.append("vn %.6f %.6f %.6f" % (n[0] / length, n[1] / length, n[2] / length))
    normal += 1
    refs = []
    s_values = [uv(p)[0] for p in tri]
    for p in tri:
        s, t = uv(p)
        # Keep a facet that straddles the seam on one side of it.
        if max(s_values) - min(s_values) > 0.5 and s < 0.5:
            s += 1.0
        if p[0] == 0.0 and p[2] == 0.0:
            s = sum(v for v in s_values if v is not None) / 3
        lines.append("v %.6f %.6f %.6f" % p)
        lines.append("vt %.6f %.6f" % (s, t))
        vertex += 1
        refs.append("%d/%d/%d" % (vertex, vertex, normal))
    faces.append("f " + " ".join(refs))

out = os.path.join(os.path.dirname(os.path.abspath(__file__)), "..", "assets-src", "gem.obj")
with open(out, "w") as f:
    f.write("\n".join(lines + faces) + "\n")
print("%d facets" % len(triangles))
