#!/usr/bin/env python3
"""Draws the times of whole frames: plot.py FRAMES.json PICTURE.png"""
import json
import sys

import matplotlib

matplotlib.use("Agg")
from matplotlib import pyplot  # noqa: E402: after the choice of the backend

CONTENT = "skin-twist"
PATHS = {
    "shared": ("the library: OpenCL, in the vertex buffers", "#1f77b4", "o", "-"),
    "read back": ("OpenCL, read back, glBufferSubData", "#d62728", "s", "-"),
    "CPU": ("oneTBB and vector instructions, mapped buffers", "#444444", "^", "-"),
    "plain CPU": ("oneTBB, vertex by vertex, glBufferSubData", "#999999", "v", "-"),
    "memory, 1 core": ("limit: writing the vertices to memory, 1 core", "#2ca02c", None, ":"),
    "memory, all cores": ("limit: the same, all cores", "#2ca02c", None, "--"),
}


def main():
    if len(sys.argv) != 3:
        sys.exit("usage: plot.py FRAMES.json PICTURE.png")
    with open(sys.argv[1], encoding="utf-8") as file:
        run = json.load(file)
    figure, axes = pyplot.subplots(figsize=(7.2, 4.8), layout="constrained")
    for path, (label, colour, marker, line) in PATHS.items():
        rows = [row for row in run["rows"] if row["path"] == path and row["content"] == CONTENT]
        vertices = [row["vertices"] for row in rows]
        times = [row["milliseconds"] for row in rows]
        axes.plot(vertices, [time["median"] for time in times], marker=marker, linestyle=line,
                  color=colour, label=label)
        axes.fill_between(vertices, [time["low"] for time in times], [time["high"] for time in times],
                          color=colour, alpha=0.15, linewidth=0)
    axes.set(xscale="log", yscale="log", xlabel="vertices", ylabel="ms a frame, until OpenGL has finished",
             title=f"{run['cpu']}, {run['renderer']}")
    axes.title.set_fontsize(9)
    axes.grid(True, which="major", alpha=0.3)
    axes.legend(fontsize=8)
    figure.savefig(sys.argv[2], dpi=110)


if __name__ == "__main__":
    main()
