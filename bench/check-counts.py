#!/usr/bin/env python3
"""Compares instruction counts with the recorded ones: check-counts.py RESULTS.json RECORD.json [--record]

Compares the ratio of each operation's count to that of the direct OpenCL calls, as vyra-opencl-bench counts them
under valgrind. The same binary gives the same counts; compilers and runtimes differ a little, so growth of up to
a tenth is accepted. --record replaces the record with the results. The exit code is 1 if a ratio has grown more, or if
a recorded operation was not counted.
"""
import json
import sys

ALLOWED_GROWTH = 1.10


def ratios(results):
    """Returns the ratios by group and case, without the baselines and without third-party libraries."""
    return {
        f"{group['name']}: {case['name']}": round(case["instructionRatio"], 3)
        for group in results["groups"]
        for case in group["cases"][1:]
        if "instructionRatio" in case and "thirdParty" not in case
    }


def main():
    arguments = [argument for argument in sys.argv[1:] if argument not in ("", "--record")]
    if len(arguments) != 2:
        sys.exit("usage: check-counts.py RESULTS.json RECORD.json [--record]")
    results_file, record_file = arguments
    with open(results_file, encoding="utf-8") as file:
        counted = ratios(json.load(file))
    if "--record" in sys.argv:
        with open(record_file, "w", encoding="utf-8") as file:
            json.dump(counted, file, indent=1, sort_keys=True)
            file.write("\n")
        return
    with open(record_file, encoding="utf-8") as file:
        record = json.load(file)
    grown = {name: (ratio, record[name]) for name, ratio in counted.items()
             if name in record and ratio > record[name] * ALLOWED_GROWTH}
    for name, (ratio, before) in grown.items():
        print(f"{name}: {ratio} times the instructions of the direct calls, {before} recorded")
    missing = record.keys() - counted.keys()
    if missing:
        sys.exit("recorded, and not counted: " + ", ".join(sorted(missing)))
    compared = len(record)
    if grown:
        sys.exit(f"{len(grown)} of {compared} operations take more instructions than bench/counts.json allows")
    print(f"{compared} operations take no more instructions than recorded.")


if __name__ == "__main__":
    main()
