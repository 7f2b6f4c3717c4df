"""Tests of bench/frames/cpu_time.py: the module of each sample, and the samples that are excluded."""
import json
import pathlib
import subprocess
import sys
import unittest

SCRIPT = pathlib.Path(__file__).parents[2] / "bench/frames/cpu_time.py"
DEFORM = ("SharedBufferPath::deform()", "/b/vyra-opencl-bench-frames")
SAMPLES = [
    # thread, frames from the innermost outwards, the module or None if excluded
    (1, [("strlen", "/l/libc.so.6"), ("main", "/b/vyra-opencl-bench-frames")], None),  # outside of an evaluation
    (1, [("malloc", "/l/libc.so.6"), ("AutoCLEventList::grow()", "/b/libvyra-opencl.so.1.0.0"), DEFORM], "library"),
    (1, [("entry", "[kernel.kallsyms]"), ("clFlush", "/l/libOpenCL.so.1.0.0"), DEFORM], "runtime"),
    (2, [("vyra::DeformationQueue::deform()", "/b/libvyra-evaluator.so.1.0.0")], "evaluator"),
    (2, [("tbb::task::execute()", "/b/vyra-opencl-bench-frames")], "host"),
    (2, [("viewer::Scene::poseCharacter()", "/b/vyra-opencl-bench-frames")], None),
    (3, [("skin", "/c/pocl/kcache/AB/skin/64/skin.so"), ("run", "/l/pocl/libpocl-devices-pthread.so")], "kernels"),
    (3, [("memcpy", "/l/libc.so.6"), ("copy", "/l/pocl/libpocl-devices-pthread.so")], "runtime"),
    (3, [("futex (inlined)", "inlined"), ("wait", "/l/libc.so.6")], "runtime"),
]


class CpuTime(unittest.TestCase):
    def test_sample_counts_for_module_of_innermost_frame(self):
        text = "".join(
            f"vyra-opencl-ben {thread} \n"
            + "".join(f"\t    7f00 {symbol} ({module})\n" for symbol, module in frames)
            + "\n"
            for thread, frames, _ in SAMPLES
        ) + "Xvfb 9 \n\t    7f00 main (/usr/bin/Xvfb)\n\n"
        output = subprocess.run([sys.executable, SCRIPT], input=text, capture_output=True, text=True, check=True)
        modules = [module for _, _, module in SAMPLES]
        expected = {name: modules.count(name) for name in ("kernels", "runtime", "library", "evaluator", "host")}
        self.assertEqual(json.loads(output.stdout), expected)


if __name__ == "__main__":
    unittest.main()
