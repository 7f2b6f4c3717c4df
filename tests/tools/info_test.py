"""Runs vyra-opencl-info in many scenarios, and checks its exit code and its JSON.

The environment variables TEST_... name the program, its schema, and the parts of the scenarios.
"""
import json
import os
import pathlib
import subprocess
import tempfile
import unittest

import jsonschema

PROGRAM = os.environ["TEST_PROGRAM"]
OTHER_OPENCL = os.environ["TEST_OTHER_OPENCL"]  # directories with unusable OpenCL libraries
NO_GRAPHICS = 4
POCL = "The pocl project"
LAYER = {"OPENCL_LAYERS": os.environ["TEST_LAYER"]}
INTEL = ["--device-vendor=0x8086"]
NVIDIA = ["--device-vendor=0x10de"]
ABSENT = object()


class Part(str):
    """Equals every text that contains it."""

    __hash__ = str.__hash__

    def __eq__(self, text):
        return isinstance(text, str) and str(self) in text


# Variables to set (None: to remove), options, exit code, values in the JSON by path.
REAL = {
    "a working machine": (LAYER | {"VYRA_OPENCL_PLATFORM": POCL}, [], 0, {
        "stop": None, "selfTest.passed": True, "selfTest.evaluations": 30, "platforms.0.accepted": True,
        "platforms.0.devices.0.accepted": True, "variables.1.effect": "changed"}),
    "finish calls are forced": (LAYER | {"VYRA_OPENCL_FORCE_FINISH": "1"}, ["--platform=" + POCL], 0, {
        "selfTest.passed": True, "variables.1.effect": "changed"}),
    "nothing is batched": (
        LAYER | {"VYRA_OPENCL_FORCE_THREADING": "0", "VYRA_OPENCLTOGRAPHICS_SYNC_MODE": "3"},
        ["--platform=" + POCL], 0, {
            "selfTest.passed": True, "decisions.2.value": "no",
            "decisions.2.variable": "VYRA_OPENCL_FORCE_THREADING", "variables.1.effect": "changed",
            "variables.1.explanation": Part("in place of mode 1")}),
    "the platform cannot share": ({"VYRA_OPENCL_PLATFORM": POCL}, [], 1, {
        "stop.step": "device", "platforms.0.devices.0.accepted": False,
        "stop.reason": Part("does not list cl_khr_gl_sharing"), "stop.remedy": Part("libglshare.so")}),
    "the platform's name is misspelt": ({"VYRA_OPENCL_PLATFORM": "the pocl projekt"}, [], 1, {
        "stop.step": "platform", "platforms.0.accepted": False, "stop.reason": Part("'the pocl projekt'"),
        "stop.remedy": Part("Probably 'The pocl project' is meant")}),
    "the vendor is not known": ({}, ["--device-vendor=74565"], 1, {
        "stop.step": "vendor", "startUp.vendorId": 74565, "stop.reason": Part("0x12345"),
        "stop.remedy": Part("'The pocl project'")}),
    "OpenCL is switched off": ({"VYRA_DISABLE_OPENCL": "0", "VYRA_OPENCL_FORCE_FINNISH": "1"}, [], 1, {
        "stop.step": "switch", "stop.reason": Part("'0'"), "stop.remedy": Part("unset VYRA_DISABLE_OPENCL"),
        "loader.loaded": True, "variables.1.effect": "unknown",
        "variables.1.suggestion": "VYRA_OPENCL_FORCE_FINISH"}),
    "no vendor is known, and one platform shares": (LAYER, [], 0, {
        "selfTest.passed": True, "decisions.0.reason": Part("this platform alone shares"), "decisions.0.variable": None,
        "variables.1": ABSENT}),
    "the platform has no devices": (LAYER | {"POCL_CACHE_DIR": "/dev/null/none"}, [], 1, {
        "stop.step": "device", "stop.reason": Part("'The pocl project' has 0 devices."),
        "stop.remedy": Part("PoCL has no devices if")}),
    "a layer is missing": ({"OPENCL_LAYERS": "/none.so"}, [], 1, {
        "stop.reason": Part("OPENCL_LAYERS names '/none.so', which is not a file. "),
        "stop.remedy": Part("Correct OPENCL_LAYERS. ")}),
    "a layer is missing and OpenCL is off": ({"OPENCL_LAYERS": "/none.so", "VYRA_DISABLE_OPENCL": "1"}, [], 1, {
        "stop.reason": Part("which is not a file. VYRA_DISABLE_OPENCL is set"),
        "stop.remedy": Part("Correct OPENCL_LAYERS. Remove")}),
    "no driver is installed": ({"OCL_ICD_VENDORS": "/nonexistent"}, [], 1, {
        "summary": "OpenCL is off: this machine has no OpenCL platform.", "stop.step": "platform",
        "stop.reason": Part("This machine has no OpenCL platform: the loader found no driver."),
        "stop.remedy": Part("Install")}),
    "names are misspelt": (
        {"vyra_disable_opencl": "1", "GLSHARE_ZERO_COPIES": "1"}, ["--platform=" + POCL], 1, {
            "variables.0.name": "GLSHARE_ZERO_COPIES", "variables.0.suggestion": "GLSHARE_ZERO_COPY",
            "variables.2.effect": "unknown", "variables.2.suggestion": "VYRA_DISABLE_OPENCL"}),
    "there is no OpenCL library": ({"LD_LIBRARY_PATH": OTHER_OPENCL + "/none"}, [], 1, {
        "stop.step": "loader", "stop.reason": Part("libOpenCL.so.1"), "stop.remedy": Part("Install"),
        "loader.loaded": False}),
    "the OpenCL library is incomplete": ({"LD_LIBRARY_PATH": OTHER_OPENCL + "/incomplete"}, [], 1, {
        "stop.step": "loader", "stop.reason": Part("lacks functions that every OpenCL has: cl"),
        "stop.remedy": Part("Replace"), "loader.loaded": False}),
    "there is no display": (dict.fromkeys(["DISPLAY", "WAYLAND_DISPLAY", "QT_QPA_PLATFORM"]), [], NO_GRAPHICS, {
        "stop.step": "renderer", "stop.remedy": Part("xvfb-run"), "renderer.usable": False,
        "startUp.attempted": False}),
    "the display does not exist": ({"DISPLAY": ":4711", "QT_QPA_PLATFORM": "xcb"}, [], NO_GRAPHICS, {
        "stop.step": "renderer", "stop.reason": Part("could not connect to display")}),
}
# The same for scripted scenarios, by name; the platform is Intel's except in the scenarios of NVIDIA.
SCRIPTED = [
    # Kernels of the scripted runtime do nothing.
    ("ordinary", {}, INTEL, 3, {
        "on": True, "selfTest.milliseconds": None,
        "selfTest.problem": "60000 of 60000 numbers in OpenGL's memory are wrong in evaluation 1"}),
    ("no-buffer", {}, INTEL, 3, {
        "selfTest.status.code": -60, "selfTest.status.name": "CL_INVALID_GL_OBJECT"}),
    ("no-platform", {}, INTEL, 1, {
        "stop.step": "platform", "stop.reason": Part("no OpenCL platform"), "stop.remedy": Part("Install")}),
    ("two-platforms", {}, INTEL, 3, {
        "platforms.0.accepted": True,
        "platforms.1.rejection": "another platform of the same vendor comes first"}),
    ("cpu", {}, INTEL, 1, {"stop.step": "device", "stop.reason": Part("not GPUs: Scripted GPU (CPU)")}),
    ("context-unknown", {}, INTEL, 1, {
        "stop.step": "device", "stop.status.code": -1000,
        "stop.reason": Part("CL_INVALID_GL_SHAREGROUP_REFERENCE_KHR (-1000)")}),
    ("refused-driver", {}, NVIDIA, 1, {
        "stop.step": "driver", "stop.reason": Part("365.10"),
        "stop.remedy": Part("VYRA_OPENCL_IGNORE_DRIVER_VERSION=1"),
        "platforms.0.devices.0.rejection": "the GPU's driver is refused",
        "decisions.4.id": "device", "decisions.5": ABSENT}),
    ("refused-driver", {"VYRA_OPENCL_IGNORE_DRIVER_VERSION": "0"}, NVIDIA, 3, {
        "variables.0.effect": "changed", "decisions.5.id": "driver",
        "decisions.5.variable": "VYRA_OPENCL_IGNORE_DRIVER_VERSION"}),
    ("old-driver", {}, NVIDIA, 3, {
        "decisions.3.value": "no", "decisions.8.id": "opencl-to-graphics",
        "decisions.8.value": "event query (2)"}),
    # A status that no header names.
    ("no-context", {}, NVIDIA, 1, {
        "stop.step": "context", "stop.status.code": -9999, "stop.status.name": None,
        "stop.reason": Part("-9999"), "startUp.warnings.0.status.code": -9999}),
    # Queries of the device fail, which stops start-up without a message.
    ("no-driver-version", {}, NVIDIA, 1, {
        "stop.step": "driver", "stop.reason": Part("CL_INVALID_VALUE (-30)"), "stop.remedy": Part("update it")}),
    ("no-device-type", {}, INTEL, 1, {
        "stop.step": "availability", "stop.status.code": -30, "stop.reason": Part("A query of the device failed")}),
    ("no-float-config", {}, INTEL, 1, {
        "stop.step": "double-precision", "stop.status.code": -30, "stop.reason": Part("query for the device's double precision")}),
    ("no-acquire", {}, INTEL, 1, {
        "stop.step": "sharing-functions", "stop.reason": Part("clEnqueueAcquireGLObjects"),
        "loader.missingSharing.0": "clEnqueueAcquireGLObjects"}),
    ("unavailable", {}, INTEL, 1, {
        "stop.step": "availability", "platforms.0.devices.0.available": False}),
    ("no-double", {"VYRA_OPENCL_OFF_WITHOUT_DOUBLE_SUPPORT": "1"}, INTEL, 1, {
        "stop.step": "double-precision", "variables.0.effect": "changed"}),
    # A forced mode is overridden.
    ("no-gl-event", {"VYRA_OPENCLTOGRAPHICS_SYNC_MODE": "1"}, INTEL, 3, {
        "variables.0.effect": "none", "variables.0.explanation": Part("does not support"),
        "decisions.8.value": "event query (2)"}),
    ("no-queue", {}, INTEL, 1, {
        "stop.step": "queue", "stop.status.name": "CL_INVALID_QUEUE_PROPERTIES"}),
]


def run_info(environment, options):
    """Runs the program without inherited variables that affect the library or its OpenCL."""
    affecting = ("VYRA_", "GLSHARE_", "OPENCL_LAYERS")
    variables = {name: value for name, value in os.environ.items() if not name.startswith(affecting)} | environment
    variables = {name: value for name, value in variables.items() if value is not None}
    return subprocess.run([PROGRAM, *options], env=variables, capture_output=True, text=True, check=False)


def scripted(scenario):
    return {"LD_LIBRARY_PATH": os.environ["TEST_SCENARIOS"], "INFO_SCENARIO": scenario}


def at(path, value):
    """Returns the value at a path such as "platforms.0.vendor"."""
    for part in path.split("."):
        try:
            value = value[int(part)] if isinstance(value, list) else value[part]
        except (IndexError, KeyError, TypeError):
            return ABSENT
    return value


def closed(schema):
    """Returns the schema, changed to reject members that it does not describe."""
    if isinstance(schema, list):
        return [closed(part) for part in schema]
    if not isinstance(schema, dict):
        return schema
    schema = {key: closed(value) for key, value in schema.items()}
    types = schema.get("type", [])
    if "properties" in schema or "object" in types:
        schema.setdefault("additionalProperties", False)
    if "array" in types:
        schema.setdefault("items", False)
    return schema


class Info(unittest.TestCase):
    @classmethod
    def setUpClass(cls):
        with open(os.environ["TEST_SCHEMA"], encoding="utf-8") as file:
            cls.schema = jsonschema.Draft202012Validator(closed(json.load(file)))

    def check(self, environment, options, exit_code, expected):
        run = run_info(environment, [*options, "--json"])
        report = json.loads(run.stdout)
        if run.returncode == NO_GRAPHICS != exit_code:
            self.skipTest("no OpenGL: " + at("renderer.problem", report))
        self.assertEqual((run.returncode, report["exitCode"], run.stderr), (exit_code, exit_code, ""), run.stdout)
        self.assertEqual([], [f"{error.json_path}: {error.message}" for error in self.schema.iter_errors(report)])
        times = at("selfTest.milliseconds", report)
        for milliseconds in times.values() if isinstance(times, dict) else ():
            self.assertGreater(milliseconds, 0)
        for path, value in expected.items():
            self.assertEqual(value, at(path, report), path)

    def test_real_opencl_matches_expected_report(self):
        for name, row in REAL.items():
            with self.subTest(name):
                self.check(*row)

    def test_scripted_scenario_matches_expected_report(self):
        for scenario, environment, *rest in SCRIPTED:
            with self.subTest(scenario, **environment):
                self.check(scripted(scenario) | environment, *rest)

    def test_second_run_prints_same_report(self):
        """A run keeps no state. This scenario reports no times."""
        first, second = (run_info(scripted("ordinary"), [*INTEL, "--json"]).stdout for _ in range(2))
        self.assertEqual(first, second)
        self.assertTrue(first)

    def test_display_without_usable_opengl_prints_error_and_returns_4(self):
        with tempfile.TemporaryDirectory() as folder:
            # Empty files take precedence over the real libraries.
            for name in ("libGLX_mesa.so.0", "libGLX_indirect.so.0"):
                pathlib.Path(folder, name).touch()
            run = run_info({"LD_LIBRARY_PATH": folder, "QT_QPA_PLATFORM": "xcb"}, [])
        self.assertEqual(run.returncode, NO_GRAPHICS, run.stderr)
        self.assertIn("OpenGL cannot be started on this display", run.stderr)

    def test_help_returns_0_and_wrong_option_prints_error_and_returns_2(self):
        run = run_info({}, ["--help"])
        self.assertEqual((run.returncode, run.stdout.count("--device-vendor"), run.stderr), (0, 1, ""))
        run = run_info({}, ["--jsn"])
        error = "vyra-opencl-info: there is no option '--jsn'; see vyra-opencl-info --help\n"
        self.assertEqual((run.returncode, run.stdout, run.stderr), (2, "", error))


if __name__ == "__main__":
    unittest.main()
