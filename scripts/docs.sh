#!/usr/bin/env bash
# Makes the pages of the C interfaces in build/docs from the headers. Fails on a warning of Doxygen, on a function or type
# without a description, and on a link to a page that does not exist.
set -euo pipefail

cd "$(dirname "$0")/.."
scripts/setup.sh
rm -rf build/docs
mkdir -p build
VERSION=$(sed -n 's/^ *VERSION \([0-9.]*\)$/\1/p' CMakeLists.txt) doxygen docs/Doxyfile
python3 - <<'PYTHON'
import pathlib
import re
import sys
import xml.etree.ElementTree as ET

described = set()
faults = []
for page in pathlib.Path("build/docs/xml").glob("*.xml"):
    for item in ET.parse(page).iter():
        name = item.findtext("name") or item.findtext("compoundname")
        is_type = item.tag == "compounddef" and item.get("kind") == "struct"
        if is_type or item.get("kind") in ("function", "typedef", "enum") and item.tag == "memberdef":
            text = "".join(t for d in ("briefdescription", "detaileddescription") for t in item.find(d).itertext())
            described.add(name)
            if not text.strip():
                faults.append(f"{name} has no description")
for header in pathlib.Path("include/tonewright").glob("*.h"):
    for name in re.findall(r"^TONEWRIGHT_API\s[^;(]*?(\w+)\(", header.read_text(), re.M):
        if name not in described:
            faults.append(f"{name} is on no page")
html = pathlib.Path("build/docs/html")
for page in html.glob("*.html"):
    for link in re.findall(r'href="([^"#]+)', page.read_text()):
        if ":" not in link and not (html / link).exists():
            faults.append(f"{page.name} links to {link}, which does not exist")
print(*sorted(set(faults)), sep="\n", end="\n" if faults else "")
sys.exit(bool(faults) or len(described) < 100)
PYTHON
rm -r build/docs/xml
echo "build/docs/html/index.html"
