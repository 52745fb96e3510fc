#!/usr/bin/env python3
"""Writes src/zvr_lang_manager/LanguageTables.cpp from the JSON files of Debian's package iso-codes.

The result is committed. Run this again, with iso-codes installed, when the standards change.
"""

import json
import pathlib

ISO = pathlib.Path("/usr/share/iso-codes/json")
TARGET = pathlib.Path(__file__).parent.parent / "src/zvr_lang_manager/LanguageTables.cpp"


def literal(text):
    escaped = "".join(c if ord(c) < 128 else f"\\u{ord(c):04x}" for c in text)
    return f'u"{escaped}"'


def rows(table):
    return "\n".join("    {" + ", ".join(map(literal, row)) + "}," for row in sorted(table))


languages = []
for entry in json.loads((ISO / "iso_639-2.json").read_text())["639-2"]:
    code = entry["alpha_3"]
    if entry.get("bibliographic", code) != code:
        code = entry["bibliographic"] + "/" + code
    # "qaa-qtz" is a range reserved for local use, not a language.
    if len(code) == 3 or "/" in code:
        languages.append((code, entry.get("alpha_2", ""), entry["name"]))
countries = [
    (entry["alpha_2"], entry.get("common_name", entry["name"]))
    for entry in json.loads((ISO / "iso_3166-1.json").read_text())["3166-1"]
]

TARGET.write_text(f"""// Made by scripts/generate-language-tables.py from ISO 639-2 and ISO 3166-1; do not edit.
#include "zvr_lang_manager/LanguageTables.h"

namespace zvr_lang {{

namespace {{

// clang-format off
constexpr SLanguageRow kLanguages[] = {{
{rows(languages)}
}};

constexpr SCountryRow kCountries[] = {{
{rows(countries)}
}};
// clang-format on

}} // namespace

std::span<const SLanguageRow> getLanguageTable() {{
    return kLanguages;
}}

std::span<const SCountryRow> getCountryTable() {{
    return kCountries;
}}

}} // namespace zvr_lang
""")
