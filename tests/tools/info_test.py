"""vyra-opencl-info in worlds of all kinds: what it answers, and that its JSON keeps to its description.

The environment variables TEST_... name the program, its schema, and what a world is made of.
"""
import json
import os
import subprocess
import unittest

import jsonschema

PROGRAM = os.environ["TEST_PROGRAM"]
OTHER_OPENCL = os.environ["TEST_OTHER_OPENCL"]  # folders with OpenCL libraries that cannot be used
NO_GRAPHICS = 4
POCL = "The pocl project"
LAYER = {"OPENCL_LAYERS": os.environ["TEST_LAYER"]}
INTEL = ["--device-vendor=0x8086"]
NVIDIA = ["--device-vendor=0x10de"]
ABSENT = object()


class Part(str):
    """Equal to every text that it is a part of."""

    __hash__ = str.__hash__

    def __eq__(self, text):
        return isinstance(text, str) and str(self) in text


# What is set (None: removed) and the options; the exit code; values in the JSON, by path.
ON_THIS_MACHINE = {
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
    "names are written in other ways": (
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
# The same in scripted worlds, which are named first; the platform is Intel's unless the world says otherwise.
SCRIPTED = [
    # Its kernels do nothing.
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
    ("cpu", {}, INTEL, 1, {"stop.step": "device", "stop.reason": Part("no GPUs: Scripted GPU (CPU)")}),
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
    # With a status of no header.
    ("no-context", {}, NVIDIA, 1, {
        "stop.step": "context", "stop.status.code": -9999, "stop.status.name": None,
        "stop.reason": Part("-9999"), "startUp.warnings.0.status.code": -9999}),
    # Questions to the device fail, which stops start-up without a message.
    ("no-driver-version", {}, NVIDIA, 1, {
        "stop.step": "driver", "stop.reason": Part("CL_INVALID_VALUE (-30)"), "stop.remedy": Part("update it")}),
    ("no-device-type", {}, INTEL, 1, {
        "stop.step": "availability", "stop.status.code": -30, "stop.reason": Part("does not answer")}),
    ("no-float-config", {}, INTEL, 1, {
        "stop.step": "double-precision", "stop.status.code": -30, "stop.reason": Part("does not tell")}),
    ("no-acquire", {}, INTEL, 1, {
        "stop.step": "sharing-functions", "stop.reason": Part("clEnqueueAcquireGLObjects"),
        "loader.missingSharing.0": "clEnqueueAcquireGLObjects"}),
    ("unavailable", {}, INTEL, 1, {
        "stop.step": "availability", "platforms.0.devices.0.available": False}),
    ("no-double", {"VYRA_OPENCL_OFF_WITHOUT_DOUBLE_SUPPORT": "1"}, INTEL, 1, {
        "stop.step": "double-precision", "variables.0.effect": "changed"}),
    # A forced mode is overridden.
    ("no-gl-event", {"VYRA_OPENCLTOGRAPHICS_SYNC_MODE": "1"}, INTEL, 3, {
        "variables.0.effect": "none", "variables.0.explanation": Part("lacks the means"),
        "decisions.8.value": "event query (2)"}),
    ("no-queue", {}, INTEL, 1, {
        "stop.step": "queue", "stop.status.name": "CL_INVALID_QUEUE_PROPERTIES"}),
]


def run_info(environment, options):
    """Runs the program without the variables of outside that steer the library or its OpenCL."""
    steering = ("VYRA_", "GLSHARE_", "OPENCL_LAYERS")
    variables = {name: value for name, value in os.environ.items() if not name.startswith(steering)} | environment
    variables = {name: value for name, value in variables.items() if value is not None}
    return subprocess.run([PROGRAM, *options], env=variables, capture_output=True, text=True, check=False)


def scripted(world):
    return {"LD_LIBRARY_PATH": os.environ["TEST_WORLDS"], "INFO_WORLD": world}


def at(path, value):
    """The value at a path such as "platforms.0.vendor"."""
    for part in path.split("."):
        try:
            value = value[int(part)] if isinstance(value, list) else value[part]
        except (IndexError, KeyError, TypeError):
            return ABSENT
    return value


def closed(schema):
    """The schema, refusing what it does not describe: nothing goes undocumented."""
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

    def explain(self, environment, options, exit_code, expected):
        run = run_info(environment, [*options, "--json"])
        facts = json.loads(run.stdout)
        if run.returncode == NO_GRAPHICS != exit_code:
            self.skipTest("no OpenGL: " + at("renderer.problem", facts))
        self.assertEqual((run.returncode, facts["exitCode"], run.stderr), (exit_code, exit_code, ""), run.stdout)
        self.assertEqual([], [f"{error.json_path}: {error.message}" for error in self.schema.iter_errors(facts)])
        times = at("selfTest.milliseconds", facts)
        for milliseconds in times.values() if isinstance(times, dict) else ():
            self.assertGreater(milliseconds, 0)
        for path, value in expected.items():
            self.assertEqual(value, at(path, facts), path)

    def test_this_machines_opencl_is_explained(self):
        for name, row in ON_THIS_MACHINE.items():
            with self.subTest(name):
                self.explain(*row)

    def test_scripted_worlds_are_explained(self):
        for world, environment, *rest in SCRIPTED:
            with self.subTest(world, **environment):
                self.explain(scripted(world) | environment, *rest)

    def test_the_same_is_told_twice(self):
        """Nothing is changed on the machine, and nothing depends on chance; no times are told here."""
        first, second = (run_info(scripted("ordinary"), [*INTEL, "--json"]).stdout for _ in range(2))
        self.assertEqual(first, second)
        self.assertTrue(first)

    def test_wrong_options_get_a_sentence(self):
        run = run_info({}, ["--jsn"])
        said = "vyra-opencl-info: there is no option '--jsn'; see vyra-opencl-info --help\n"
        self.assertEqual((run.returncode, run.stdout, run.stderr), (2, "", said))


if __name__ == "__main__":
    unittest.main()
