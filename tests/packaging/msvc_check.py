"""Compiles the libraries' sources for Windows by the rules of Microsoft's compiler, as far as clang knows them.

    msvc_check.py BUILD

BUILD is a configured build for Windows. The headers are those of mingw-w64 and libstdc++, so this shows neither
Microsoft's standard library nor its warnings. It does show what its rules for classes with __declspec(dllexport)
reject: such a class is instantiated with all of its members. The exit code is 1 if a source does not compile.
"""
import concurrent.futures
import json
import os
import pathlib
import shlex
import subprocess
import sys

build = pathlib.Path(sys.argv[1])
gcc = subprocess.run(["x86_64-w64-mingw32-g++-posix", "-print-libgcc-file-name"],
                     capture_output=True, text=True, check=True).stdout
headers = pathlib.Path(gcc).parent / "include/c++"
compiler = [
    "clang++", "--target=x86_64-pc-windows-msvc", "-fsyntax-only", "-std=c++20", "-fms-extensions",
    "-fno-ms-compatibility", "-Wall", "-Wextra", "-Wpedantic", "-Wshadow", "-Wconversion", "-Werror",
    # g++ has these, and the headers ask for them.
    "-D__declspec=__declspec", "-D__MINGW_IMPORT=extern __declspec(dllimport)",
    "-D__GCC_DESTRUCTIVE_SIZE=64", "-D__GCC_CONSTRUCTIVE_SIZE=64",
    "-isystem", str(headers), "-isystem", str(headers / "x86_64-w64-mingw32"),
    "-isystem", "/usr/x86_64-w64-mingw32/include"]


def options(command):
    """Returns the macros and include folders of a command for g++."""
    words = iter(shlex.split(command))
    for word in words:
        if word == "-isystem":
            yield from (word, next(words))
        elif word.startswith(("-D", "-I")):
            yield word


def check(entry):
    run = subprocess.run([*compiler, *options(entry["command"]), entry["file"]], cwd=entry["directory"],
                         capture_output=True, text=True, check=False)
    return entry["file"], run.returncode, run.stderr


entries = [entry for entry in json.loads((build / "compile_commands.json").read_text())
           if "_BUILDING " in entry["command"] or "/glshare/CMakeFiles/glshare.dir/" in entry["command"]]
with concurrent.futures.ThreadPoolExecutor(os.cpu_count()) as pool:
    results = list(pool.map(check, entries))
failures = [result for result in results if result[1]]
for file, _, errors in failures:
    print(f"{file}\n{errors}")
print(f"{len(results) - len(failures)} of {len(results)} sources compile")
sys.exit(bool(failures) or not results)
