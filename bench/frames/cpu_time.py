#!/usr/bin/env python3
"""Shares the processor time of evaluations out: kernels, the OpenCL runtime, the library, the host.

Reads what `perf script -F comm,tid,ip,sym,dso` prints for a run of vyra-opencl-bench-frames, and prints one
JSON object: the samples by room. A sample belongs to the room of its innermost frame outside of the C and C++
libraries and the system: what the library has the allocator do counts for the library.
"""
import json
import re
import sys

NEUTRAL = re.compile(r"kernel|vdso|/ld-linux|/libc\.|/libm\.|/libstdc\+\+|/libgcc_s|^inlined$|^\[unknown\]$")
ROOMS = [
    ("runtime", re.compile(r"libpocl|libOpenCL|libglshare|libLLVM|libhwloc")),
    # PoCL links each kernel into a library of its own, in its cache.
    ("kernels", re.compile(r"/pocl/kcache/")),
    ("library", re.compile(r"libvyra-opencl\.so")),
    ("evaluator", re.compile(r"libvyra-evaluator\.so")),
]
# Outside of evaluations: poses of the next frame, start and end.
NOT_EVALUATION = re.compile(r"viewer::Scene::|viewer::verify|clBuildProgram|POclBuildProgram")
EVALUATION = re.compile(r"SharedBufferPath::(deform|drawn)")


def samples(lines):
    """Yields (thread id, [(symbol, object), ...]), innermost frame first."""
    header, frames = None, []
    for line in lines:
        line = line.rstrip()
        if not line:
            if header:
                yield header, frames
            header, frames = None, []
        elif line[0].isspace():
            match = re.match(r"\s+[0-9a-f]+ (.*) \((.*?)\)$", line)
            if match:
                frames.append(match.groups())
        else:
            header = re.match(r"(.*?)\s+(\d+)\s*$", line).groups()
    if header:
        yield header, frames


def room_of(frames):
    for symbol, module in frames:
        if NEUTRAL.search(module):
            continue
        for room, pattern in ROOMS:
            if pattern.search(module):
                return room
        return "host"
    return "runtime"  # threads of the runtime's own, between two commands


def main():
    counts = dict.fromkeys(["kernels", "runtime", "library", "evaluator", "host"], 0)
    main_thread = None
    for (command, thread), frames in samples(sys.stdin):
        if not command.startswith("vyra-opencl-ben"):
            continue
        main_thread = main_thread or thread
        symbols = " ".join(symbol for symbol, _ in frames)
        if NOT_EVALUATION.search(symbols):
            continue
        if thread == main_thread and not EVALUATION.search(symbols):
            continue
        counts[room_of(frames)] += 1
    json.dump(counts, sys.stdout)
    print()


if __name__ == "__main__":
    main()
