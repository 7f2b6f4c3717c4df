"""Writes the guides for an installation.

    installed_guides.py SOURCE_DIRECTORY OUTPUT_DIRECTORY

Links to installed files are adjusted; of other links only the text stays, marked "(in the source)". Lines
between <!-- source only --> and <!-- end --> are left out.
"""
import os
import pathlib
import re
import shutil
import sys

# Of docs/. The others are about building the library, or are its benchmarks.
GUIDES = ["README", "deformers", "evaluation", "evaluator", "glshare", "messages", "own-evaluator", "pitfalls",
          "profiling", "synchronisation", "troubleshooting"]
# Below the installation's prefix.
GUIDES_FOLDER = "share/doc/libvyra-opencl-dev/guides"
HEADERS_FOLDER = "include/vyra-opencl"
EXAMPLES_FOLDER = "share/doc/libvyra-opencl-dev/examples"
OTHER_PLACES = {
    "glshare/README.md": "share/doc/glshare/README.md",
    "glshare/glshare.h": "include/glshare.h",
    "tools/info/report/info.schema.json": "share/vyra-opencl/info.schema.json",
    "evaluator/kernels/deformers.clh": "share/vyra-opencl/kernels/deformers.clh",
}

SOURCE_ONLY = re.compile(r"<!-- source only -->\n.*?<!-- end -->\n", re.DOTALL)
QUOTE_MARK = re.compile(r"^<!-- from .* -->\n", re.MULTILINE)
LINK = re.compile(r"(!?)\[([^\]]*)\]\(([^)\s]+)\)")
TABLE_ROW = re.compile(r"^\| \[[^\]]*\]\(([a-z-]+)\.md\) \|.*\n", re.MULTILINE)


def public_headers(source):
    """The installed headers, by their path in the source."""
    headers = set(source.glob("src/host/*.h"))
    for folder, name in (("src", "VYRA_OPENCL_PUBLIC_HEADERS"), ("evaluator", "VYRA_EVALUATOR_PUBLIC_HEADERS"),
                         ("standalone", "VYRA_HOST_HEADERS")):
        text = (source / folder / "CMakeLists.txt").read_text(encoding="utf-8")
        listed = re.search(rf"set\({name}\s(.*?)\)", text, re.DOTALL).group(1)
        headers |= {source / folder / path for path in re.findall(r"\S+\.h", listed)}
    return headers


def installed_path(target, source, headers):
    """Where a file of the source is installed below the prefix; None if it is not."""
    relative = target.relative_to(source)
    if relative.parts[0] == "docs" and (relative.stem in GUIDES or "pictures" in relative.parts):
        return f"{GUIDES_FOLDER}/{relative.relative_to('docs')}"
    if relative.parts[0] == "examples":
        return f"{EXAMPLES_FOLDER}/{relative.relative_to('examples')}"
    if target in headers:
        return f"{HEADERS_FOLDER}/{relative.relative_to('src') if relative.parts[0] == 'src' else relative}"
    return OTHER_PLACES.get(str(relative))


def installed(text, source, headers):
    def replaced(match):
        image, label, target = match.groups()
        if re.match(r"[a-z]+:|#", target):
            return match.group()
        path, _, anchor = target.partition("#")
        place = installed_path((source / "docs" / path).resolve(), source, headers)
        if place is None:
            return f"{label} (in the source)"
        return f"{image}[{label}]({os.path.relpath(place, GUIDES_FOLDER)}{anchor and '#' + anchor})"

    text = SOURCE_ONLY.sub("", text)
    text = TABLE_ROW.sub(lambda row: row.group() if row.group(1) in GUIDES else "", text)
    return LINK.sub(replaced, QUOTE_MARK.sub("", text))


def main():
    source, output = (pathlib.Path(argument).resolve() for argument in sys.argv[1:])
    headers = public_headers(source)
    shutil.rmtree(output, ignore_errors=True)
    (output / "pictures").mkdir(parents=True)
    for guide in GUIDES:
        text = (source / "docs" / f"{guide}.md").read_text(encoding="utf-8")
        text = installed(text, source, headers)
        (output / f"{guide}.md").write_text(text, encoding="utf-8")
        for picture in re.findall(r"\]\(pictures/([^)]+)\)", text):
            shutil.copy(source / "docs/pictures" / picture, output / "pictures")


if __name__ == "__main__":
    main()
