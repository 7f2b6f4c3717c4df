"""The project's commands, run in a copy of the project whose tools are stand-ins that only log their calls.

    scripts_test.py SOURCE_DIRECTORY CTEST
"""
import os
import pathlib
import re
import shutil
import subprocess
import sys
import tempfile
import unittest

SOURCE = pathlib.Path(sys.argv.pop(1))
CTEST = sys.argv.pop(1)
STAND_IN = '#!/bin/sh\necho "$(basename "$0") $*" >>"$TEST_LOG"\n'
# Answers --help itself; else logs the folder, too.
STAND_IN_CTEST = f'#!/bin/sh\n[ "$1" = --help ] && exec {CTEST} --help\necho "ctest in $PWD: $*" >>"$TEST_LOG"\n'
STAND_IN_VIEWER = '#!/bin/sh\necho "viewer in $PWD: $*" >>"$TEST_LOG"\n'
TOOLS = ["apt-get", "clang-format", "cmake", "dpkg-query", "doxygen", "ninja", "clang-tidy", "sudo"]

# Each is refused before anything is installed or built.
WRONG_USE = [
    ("abi", "--bogus"), ("bench", "--bogus"), ("bench", "--against", "bogus"), ("check", "--bogus"),
    ("check", "tests", "bogus"), ("demo", "--bogus"), ("demo", "--crowd=3", "-x", "a.fbx"), ("docs", "--bogus"),
    ("docs", "one", "two"), ("format", "--bogus"), ("gpu-check", "--bogus"), ("gpu-kit", "--bogus"), ("package", "--bogus"),
    ("package-windows", "--bogus"),
    ("pictures", "--bogus"), ("test", "--bogus"), ("test", "--asan", "--bogus"), ("test", "--fuzz", "--bogus"),
    ("test", "KernelStore"), ("test", "-R"), ("test", "--runtime"), ("test-debian", "--bogus"),
    ("test-debian", "buster"), ("test-windows", "--bogus"), ("test-windows", "-R", "A", "B"),
    ("test-windows", "--timeout"), ("tidy", "--bogus", "build"), ("tidy", "bogus"), ("trace-picture", "--bogus", "a", "b"),
]


class Scripts(unittest.TestCase):
    def setUp(self):
        folder = tempfile.TemporaryDirectory()
        self.addCleanup(folder.cleanup)
        self.root = pathlib.Path(folder.name).resolve()
        self.log = self.root / "log"
        self.elsewhere = self.root / "elsewhere"
        self.elsewhere.mkdir()
        project = self.root / "project"
        shutil.copytree(SOURCE / "scripts", project / "scripts")
        for file in ("viewer/app/Options.cpp", "tests/support/with-display"):
            (project / file).parent.mkdir(parents=True)
            shutil.copy(SOURCE / file, project / file)
        self.stand_in(project / "build/release/bin/vyra-viewer", STAND_IN_VIEWER)
        self.stand_in(self.root / "tools/ctest", STAND_IN_CTEST)
        for tool in TOOLS:
            self.stand_in(self.root / "tools" / tool, STAND_IN)

    def stand_in(self, path, text):
        path.parent.mkdir(parents=True, exist_ok=True)
        path.write_text(text)
        path.chmod(0o755)

    def run_script(self, name, *arguments, installed=True):
        if installed:
            (self.root / "project/scripts/packages.txt").write_text("")
            self.stand_in(self.root / "tools/dpkg-query", "#!/bin/sh\nprintf installed\n")
        environment = os.environ | {
            "PATH": f"{self.root / 'tools'}:{os.environ['PATH']}", "TEST_LOG": str(self.log), "DISPLAY": ":0"}
        run = subprocess.run(["../project/scripts/" + name, *arguments], cwd=self.elsewhere, env=environment,
                             capture_output=True, text=True, timeout=60, check=False)
        return run, self.log.read_text() if self.log.exists() else ""

    def test_an_unknown_argument_is_refused_at_once(self):
        for name, *arguments in WRONG_USE:
            with self.subTest(name, arguments=arguments):
                run, calls = self.run_script(name, *arguments)
                self.assertEqual((2, ""), (run.returncode, calls), run.stderr)
                self.assertRegex(run.stderr, f"{name}: .*({'|'.join(arguments)})")

    def test_relative_paths_are_the_callers(self):
        for name, arguments, expected in [
                ("demo", ["--output=out", "w8.gltf"],
                 f"viewer in {self.elsewhere}: --frames 60 --output=out w8.gltf"),
                ("test", ["-R", "A", "--output-junit", "a.xml", "-j2", "--output-log=b"],
                 f"-R A --output-junit {self.elsewhere}/a.xml -j2 --output-log={self.elsewhere}/b")]:
            with self.subTest(name):
                run, calls = self.run_script(name, *arguments)
                self.assertEqual(run.returncode, 0, run.stderr)
                self.assertIn(expected + "\n", calls)

    def test_package_installs_the_tools_that_it_uses(self):
        _, calls = self.run_script("package", "--check", installed=False)
        self.assertRegex(calls, r"apt-get install .*\bdpkg-dev .*\bhelp2man lintian\n")

    def test_check_runs_and_reports_every_check_whatever_fails(self):
        def ctest(percent, failed, total, what, test):
            return (f"cat <<'END'\n{percent}% tests passed, {failed} tests failed out of {total}\n\n"
                    f"The following tests {what}:\n\t  3 - library.{test}\n\nErrors while running CTest\nEND\n")

        scripts = {
            "test": "case $1 in --asan)\n" + ctest(75, 1, 4, "FAILED", "Fence (Failed)") + "exit 8 ;;\n"
                    "--tsan) echo broken build; exit 1 ;; --fuzz | --kernels) ;; *)\n"
                    + ctest(100, 0, 7, "did not run", "Direct3D (Skipped)") + "esac",
            "abi": "echo changed; exit 1", "bench": "", "test-windows": "", "package-windows": "", "format": ""}
        for name, text in scripts.items():
            self.stand_in(self.root / "project/scripts" / name, f"#!/bin/sh\n{text}\n")
        run, _ = self.run_script("check", "--ci")
        self.assertEqual(run.returncode, 1, run.stderr)
        self.assertEqual(
            [tuple(line.split()[:2]) for line in run.stdout.splitlines() if " processor " in line],
            [("passed", "tests"), ("passed", "counts"), ("passed", "windows"),
             ("passed", "windows-package"), ("passed", "format"), ("FAILED", "asan"), ("FAILED", "tsan"),
             ("passed", "clang"), ("passed", "fuzz"), ("passed", "kernels"), ("FAILED", "abi")])
        self.assertRegex(run.stdout, "(?s)broken build.*FAILED  tsan.*changed.*FAILED  abi")
        # 7 in tests and in clang, 4 in asan; one for each of the eight other checks.
        self.assertIn("\n88% tests passed, 3 tests failed out of 26\n", run.stdout)
        self.assertRegex(run.stdout, r"did not run:\n\ttests: library.Direct3D \(Skipped\)\n\tclang: ")
        self.assertTrue(run.stdout.endswith(
            "FAILED:\n\tasan: library.Fence (Failed)\n\ttsan (exit code 1)\n\tabi (exit code 1)\n"), run.stdout)

    def test_format_looks_at_what_changed_since_the_branch_point(self):
        project = self.root / "project"
        self.stand_in(project / "scripts/tidy", STAND_IN)

        def git(*arguments, date="2024-03-03T12:00:00Z"):
            subprocess.run(["git", "-c", "user.name=A", "-c", "user.email=a@b.example", *arguments], cwd=project,
                           env=os.environ | {"GIT_COMMITTER_DATE": date}, check=True, capture_output=True)

        def commit(name, **date):
            (project / name).touch()
            git("add", name)
            git("commit", "-m", name, **date)

        def tidied():
            self.log.unlink(missing_ok=True)
            run, calls = self.run_script("format", "--check", "--changed")
            self.assertEqual(run.returncode, 0, run.stderr)
            return set(re.findall(r"(\w+)\.cpp", "".join(re.findall("^tidy .*", calls, re.M))))

        (project / "no_repository.cpp").touch()
        self.assertEqual(tidied(), {"Options", "no_repository"})
        git("init", "-b", "main")
        commit("young.cpp")
        self.assertEqual(tidied(), {"Options", "no_repository", "young"}, "no commit is old enough: all files")
        git("commit", "--amend", "-m", "old", date="2024-03-01T12:00:00Z")
        (project / "no_repository.cpp").unlink()
        (project / "viewer/app/Options.cpp").unlink()
        commit("recent.cpp", date="2024-03-03T08:00:00Z")
        commit("head.cpp")
        self.assertEqual(tidied(), {"recent", "head"})
        git("update-ref", "refs/remotes/origin/main", "HEAD")
        self.assertEqual(tidied(), {"recent", "head"}, "a fresh clone")
        git("update-ref", "refs/remotes/origin/main", "HEAD~1")
        (project / "untracked.cpp").touch()
        self.assertEqual(tidied(), {"head", "untracked"})
        commit(".clang-tidy")
        self.assertEqual(tidied(), {"young", "recent", "head", "untracked"}, "other checks: all files")


if __name__ == "__main__":
    unittest.main()
