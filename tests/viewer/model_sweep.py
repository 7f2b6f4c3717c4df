"""Runs the viewer on every sample model, or on damaged copies of them.

    model_sweep.py VIEWER [--damaged N] [--seed N] [--only PATTERN] [--keep FOLDER]

Each run must end within the time limit, either with exit code 0 and a picture, or with exit code 3 or 8
and one message on standard error. Prints one line for each file. The exit code is 1 if a run ends in
another way. The same seed creates the same damaged files.
"""
import argparse
import collections
import pathlib
import random
import re
import subprocess
import sys
import tempfile
import time

SAMPLES = pathlib.Path("/usr/share/assimp/models")
# Seconds: the viewer's limit for loading, and the same for its start and the picture.
TIME_LIMIT = 120
LARGEST_DAMAGED = 1 << 20  # bytes
MESSAGE_CODES = {3, 8}  # the model cannot be used, out of memory


def sample_files():
    # Textures, buffers, materials and texts that belong to models.
    others = set(".bin .bmp .dds .frag .gif .glsl .jpeg .jpg .material .md .mtl .png .source .tga .txt .vert".split())
    return [path for path in sorted(SAMPLES.rglob("*")) if path.is_file() and path.suffix.lower() not in others]


def truncated(data, chance):
    return data[:chance.randrange(len(data))]


def with_random_bytes(data, chance):
    data = bytearray(data)
    for _ in range(chance.choice([1, 4, 32])):
        data[chance.randrange(len(data))] = chance.randrange(256)
    return bytes(data)


def with_constant_block(data, chance):
    start = chance.randrange(len(data))
    length = min(chance.choice([4, 16, 256]), len(data) - start)
    return data[:start] + chance.choice([b"\0", b"\xff"]) * length + data[start + length:]


def with_another_number(data, chance):
    numbers = list(re.finditer(rb"\d+", data))
    if not numbers:
        return with_random_bytes(data, chance)
    number = chance.choice(numbers)
    return data[:number.start()] + chance.choice([b"0", b"-1", b"4294967295", b"1e39", b"nan"]) + data[number.end():]


def with_repeated_block(data, chance):
    start = chance.randrange(len(data))
    return data[:start] + data[start:start + 512] * 2 + data[start + 512:]


DAMAGES = [truncated, with_random_bytes, with_constant_block, with_another_number, with_repeated_block]


def damaged_files(count, seed, folder):
    """Creates damaged copies, each in a folder with links to the files in the original's folder."""
    chance = random.Random(seed)
    originals = [path for path in sample_files() if 0 < path.stat().st_size <= LARGEST_DAMAGED]
    for number in range(count):
        original = chance.choice(originals)
        damage = chance.choice(DAMAGES)
        content = damage(original.read_bytes(), chance)
        place = folder / f"{number:03}-{damage.__name__.replace('_', '-')}"
        place.mkdir(parents=True)
        for sibling in original.parent.iterdir():
            (place / sibling.name).symlink_to(sibling)
        path = place / original.name
        path.unlink()
        path.write_bytes(content)
        yield path


def show(viewer, path, pictures):
    """Returns a verdict, the last line of standard error, and the duration in seconds."""
    begin = time.monotonic()
    try:
        run = subprocess.run(
            [viewer, "--allow-cpu", "--frames", "1", "--size", "320x180", "--output", pictures, path],
            capture_output=True, timeout=TIME_LIMIT, check=False)
    except subprocess.TimeoutExpired:
        return "TIMED OUT", "", TIME_LIMIT
    seconds = time.monotonic() - begin
    errors = run.stderr.decode(errors="replace").strip().splitlines()
    last = errors[-1] if errors else ""
    if run.returncode == 0:
        return "picture" if (pictures / "frame-0000.png").exists() else "NO PICTURE", "", seconds
    messages = [line for line in errors if line.startswith("vyra-viewer: ") and ": loading '" not in line]
    if run.returncode in MESSAGE_CODES and messages == [last]:
        return "message", last, seconds
    return f"EXIT CODE {run.returncode}", last, seconds


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("viewer")
    parser.add_argument("--damaged", type=int, default=0, help="number of damaged files to use instead of the samples")
    parser.add_argument("--seed", type=int, default=1)
    parser.add_argument("--only", default="", help="use only paths that match this expression")
    parser.add_argument("--keep", type=pathlib.Path, help="folder in which pictures and damaged files are kept")
    options = parser.parse_args()
    counts = collections.Counter()
    with tempfile.TemporaryDirectory() as scratch:
        folder = options.keep or pathlib.Path(scratch)
        files = damaged_files(options.damaged, options.seed, folder / "damaged") if options.damaged else sample_files()
        for path in files:
            name = path.relative_to(folder / "damaged" if options.damaged else SAMPLES)
            if not re.search(options.only, str(name)):
                continue
            verdict, message, seconds = show(options.viewer, path, folder / "pictures" / name)
            counts[verdict] += 1
            print(f"{seconds:6.1f} s  {verdict:10}  {name}  {message}", flush=True)
    print(", ".join(f"{verdict}: {count}" for verdict, count in counts.most_common()))
    return 0 if counts and counts.keys() <= {"picture", "message"} else 1


if __name__ == "__main__":
    sys.exit(main())
