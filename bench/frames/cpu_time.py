#!/usr/bin/env python3
"""Attributes the CPU time of evaluations to modules: kernels, OpenCL runtime, library, evaluator, host.

Reads the output of `perf script -F comm,tid,ip,sym,dso` for a run of vyra-opencl-bench-frames, and prints one
JSON object: the number of samples per module. A sample counts for the module of its innermost frame outside of the
C and C++ libraries and the system, so allocations by the library count for the library.
"""
import json
import re
import sys

NEUTRAL = re.compile(r"kernel|vdso|/ld-linux|/libc\.|/libm\.|/libstdc\+\+|/libgcc_s|^inlined$|^\[unknown\]$")
MODULES = [
    ("runtime", re.compile(r"libpocl|libOpenCL|libglshare|libLLVM|libhwloc")),
    # PoCL links each kernel into a separate library in its cache.
    ("kernels", re.compile(r"/pocl/kcache/")),
    ("library", re.compile(r"libvyra-opencl\.so")),
    ("evaluator", re.compile(r"libvyra-evaluator\.so")),
]
# Outside of evaluations: the poses of the next frame, start and end.
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


def module_of(frames):
    for _, shared_object in frames:
        if NEUTRAL.search(shared_object):
            continue
        for name, pattern in MODULES:
            if pattern.search(shared_object):
                return name
        return "host"
    return "runtime"  # a thread of the runtime between two commands


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
        counts[module_of(frames)] += 1
    json.dump(counts, sys.stdout)
    print()


if __name__ == "__main__":
    main()
