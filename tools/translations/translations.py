#!/usr/bin/python3
"""Keeps the translations of Tonewright's texts: see docs/translating.md.

The .po files in po/ are the source of the language files (*.zvrLang) that the library reads.
"""

import argparse
import pathlib
import re
import sys
from collections import Counter

import polib

import extraction
import packs

ROOT = pathlib.Path(__file__).resolve().parents[2]
PO = ROOT / "po"
TEMPLATE = PO / "tonewright.pot"
FOLDERS = ["src", "plugins", "companions", "host"]
APPLICATION = ("tonewright", "Tonewright")

# The pack of a key whose first part is not "peru". The library registers the packs under these names.
COMMON = "common"

# Explains the placeholders to translators.
PLACEHOLDERS = {
    "%ARGUMENT%": "what is wrong with an argument of a function",
    "%BITS%": "the number of bits per sample",
    "%BYTES%": "the number of bytes per sample",
    "%CHANNELS%": "the number of channels",
    "%CODEC%": "the name of a codec, such as FLAC",
    "%DETAIL%": "what is wrong",
    "%DURATION%": "a duration, such as 3:05.2",
    "%EXTENSION%": "the extension of a file, such as .flac",
    "%FIELDS%": "a list of placeholders for the fields of tags, such as %artist%",
    "%FORMAT%": "a format of sound, such as '44100 Hz, 2 channels and 16 bits'",
    "%FROM%": "a format of sound, such as '44100 Hz, 2 channels and 16 bits'",
    "%ID%": "the identifier of a volume or a disc",
    "%KIND%": "a type of files, such as '.flac files'",
    "%LIST%": "a list of names, separated by commas",
    "%METHOD%": "the name of a function",
    "%NUMBER%": "a number",
    "%OPTION%": "an option of the program, such as --bits",
    "%ORIGIN%": "the path of a file or 'the preset NAME'",
    "%PERCENT%": "a number in percent",
    "%RATE%": "the number of samples per second",
    "%REASON%": "a sentence with the reason, without a full stop",
    "%SIZE%": "the size of a file, such as 1.2 MB",
    "%SOURCE%": "the name of a class",
    "%SPEED%": "a number, or a size such as 1.2 MB",
    "%TARGET%": "the name of a class",
    "%TEXT%": "a text that the user has given",
    "%GAIN%": "a change of the level in decibels, such as +3.2",
    "%LIMITED%": "a change of the level in decibels, such as +3.2",
    "%WANTED%": "a change of the level in decibels, such as +3.2",
    "%TITLE%": "the title of a track",
    "%TO%": "a format of sound, such as '44100 Hz, 2 channels and 16 bits'",
    "%CODE%": "the code of a character, such as 0x2A",
    "%DESC%": "the description of an object",
    "%DEST%": "the file or folder that is written",
    "%DRIVE%": "the path of a volume",
    "%ERRORDESC%": "the operating system's text for the error, without a full stop",
    "%FIELD%": "the name of a tag's field, such as TITLE",
    "%FILE%": "the path of a file",
    "%FOLDER%": "the path of a folder",
    "%DIR%": "the path of a folder",
    "%FRAME%": "the name of a part of a tag, such as APIC",
    "%KEY%": "the name of a group of settings",
    "%LINE%": "a line number",
    "%MSG%": "the operating system's text for the error, without a full stop",
    "%NAME%": "the name of something, such as a sound device, a command or a preset",
    "%OBJECTDESC%": "the description of an object",
    "%PACKAGE%": "the name of a package",
    "%POSITION%": "a position, counted in characters or as a time",
    "%REQUIRED%": "the name of a package",
    "%SRC%": "the file or folder that is read",
    "%TYPE%": "a type of pictures, or what was given instead of a MIME type",
    "%COUNT%": "a number of messages",
    "%OPERATION%": "a function of a plug-in, with the file in parentheses",
    "%PLUGIN%": "the name of a plug-in, such as sonora2_flac",
    "%PROGRAM%": "the name of a program",
    "%SECONDS%": "a number of seconds",
    "%SIGNAL%": "the number of a signal of the operating system",
    "%TIME%": "a time, such as 3:05.2",
    "%TOTAL%": "a time, such as 3:05.2",
    "%TOTALSIZE%": "the size of a file, such as 1.2 MB",
    "%LOWEST%": "a number",
    "%HIGHEST%": "a number",
    "%GIVEN%": "a number",
    "%CAPACITY%": "a duration, such as 3:05.2",
    "%CRC%": "a checksum in hexadecimal digits",
    "%DISC%": "the path of a drive or a disc image",
    "%FILES%": "a number of files",
    "%LENGTH%": "a duration, such as 3:05.2",
    "%LIMIT%": "a number of bytes",
    "%MINUTES%": "a number of minutes",
    "%PEAK%": "a number in percent",
    "%REPAIRS%": "a number of places",
    "%TRACK%": "the number of a track",
    "%TRACKS%": "a number of tracks",
    "%ATTRIBUTE%": "the name of an attribute of XML",
    "%CLASS%": "the name of a class of elements",
    "%DETAILS%": "a sentence with the reason",
    "%ENTRY%": "the name of a file in an archive",
    "%HEIGHT%": "a number",
    "%INDEX%": "a number",
    "%KNOWN%": "a version number",
    "%NODE%": "the name of an element of XML",
    "%ROOT%": "the name of an element of XML",
    "%TAG%": "the name of an element of XML",
    "%UNIQUE%": "a number",
    "%VALUE%": "a text in a file",
    "%VERSION%": "a version number",
    "%WIDTH%": "a number",
    "%URI%": "the location of a file or stream",
}
PLACEHOLDER = re.compile(r"%[A-Z]+%")
CONVERSION = re.compile(r"%(?P<number>\d+\$)?[-+ #0]*(?:\*|\d+)?(?:\.(?:\*|\d+))?[hlLqjzt]*[cCdioxXueEfgGsS%]")
ACCELERATOR = re.compile(r"&(?!&)\w|\t[A-Za-z0-9+]+$")
LANGUAGE = re.compile(r"[a-z]{2,3}[-_][A-Z]{2}")


def pack_name(key):
    return "peru" if key.startswith("peru.") else COMMON


def language_of(po):
    language = po.metadata.get("Language", "")
    if not LANGUAGE.fullmatch(language):
        raise packs.PackError(f"the header's Language is '{language}', not one such as de_DE")
    return language.replace("_", "-")


# --- Template ---


def explain(text):
    names = sorted(set(PLACEHOLDER.findall(text)))
    return "\n".join(f"{name}: {PLACEHOLDERS.get(name, 'not explained')}" for name in names)


def make_template(texts):
    template = polib.POFile(wrapwidth=100)
    template.metadata = {
        "Project-Id-Version": APPLICATION[1],
        "MIME-Version": "1.0",
        "Content-Type": "text/plain; charset=UTF-8",
        "Content-Transfer-Encoding": "8bit",
        "Last-Translator": "",
        "Language": "",
        "X-English-Name": "",
        "X-Native-Name": "",
    }
    for text in texts.values():
        # Files only: line numbers would change with every edit of the source.
        places = sorted({(file, "") for file, _ in text.places})
        template.append(
            polib.POEntry(msgctxt=text.key, msgid=text.default, comment=explain(text.default), occurrences=places)
        )
    return template


def collect():
    texts, faults = extraction.collect(ROOT, FOLDERS)
    for text in texts.values():
        for name in set(PLACEHOLDER.findall(text.default)) - PLACEHOLDERS.keys():
            faults.append("{}:{}: {} is not explained in translations.py".format(*text.places[0], name))
    return texts, faults


def extract(arguments):
    texts, faults = collect()
    text = str(make_template(texts))
    if arguments.check:
        if not TEMPLATE.exists() or TEMPLATE.read_text(encoding="utf-8") != text:
            faults.append(f"{TEMPLATE.relative_to(ROOT)} is out of date: run translations.py extract")
    elif not faults:
        TEMPLATE.write_text(text, encoding="utf-8")
        print(f"{len(texts)} texts")
    return faults


def update(arguments):
    """Merges the template into the .po files; a text that has changed becomes fuzzy."""
    template = polib.pofile(str(TEMPLATE), wrapwidth=100)
    for file in arguments.files:
        po = polib.pofile(str(file), wrapwidth=100)
        known = {entry.msgctxt: entry for entry in po}
        merged = polib.POFile(wrapwidth=100)
        merged.metadata, merged.header = po.metadata, po.header
        for entry in template:
            old = known.get(entry.msgctxt)
            new = polib.POEntry(
                msgctxt=entry.msgctxt, msgid=entry.msgid, comment=entry.comment, occurrences=entry.occurrences
            )
            if old and not old.obsolete:
                new.msgstr, new.flags, new.tcomment = old.msgstr, old.flags, old.tcomment
                if old.msgid != new.msgid and new.msgstr and "fuzzy" not in new.flags:
                    new.flags.append("fuzzy")
            merged.append(new)
        merged.save(str(file))
    return []


# --- Packs ---


def pack(arguments):
    arguments.output.mkdir(parents=True, exist_ok=True)
    for file in arguments.files:
        po = polib.pofile(str(file))
        language = language_of(po)
        for name in ("peru", COMMON):
            made = packs.Pack(
                language,
                po.metadata.get("X-English-Name", ""),
                po.metadata.get("X-Native-Name", ""),
                *APPLICATION,
                comment=po.header,
                author=po.metadata.get("Last-Translator", ""),
                name=name,
            )
            for entry in sorted(po, key=lambda each: each.msgctxt or ""):
                if entry.obsolete or not entry.msgstr or pack_name(entry.msgctxt) != name:
                    continue
                made.entries.append(
                    packs.Entry(entry.msgctxt, entry.msgstr, entry.msgid, entry.tcomment, entry.fuzzy)
                )
            target = arguments.output / f"{name}-{language}{packs.EXTENSION}"
            target.write_bytes(packs.write(made))
    return []


def unpack(arguments):
    po = polib.POFile(wrapwidth=100)
    for file in arguments.files:
        read = packs.read(file.read_bytes())
        po.header = read.comment
        po.metadata = {
            "Project-Id-Version": read.application_name,
            "Last-Translator": read.author,
            "Language": read.language.replace("-", "_"),
            "MIME-Version": "1.0",
            "Content-Type": "text/plain; charset=UTF-8",
            "Content-Transfer-Encoding": "8bit",
            "X-English-Name": read.english_name,
            "X-Native-Name": read.native_name,
        }
        for entry in read.entries:
            flags = ["fuzzy"] if entry.unfinished else []
            po.append(
                polib.POEntry(
                    msgctxt=entry.key, msgid=entry.default, msgstr=entry.text, tcomment=entry.comment, flags=flags
                )
            )
    po.sort(key=lambda entry: entry.msgctxt)
    arguments.output.write_text(str(po), encoding="utf-8")
    return []


# --- Checks ---


def conversions_of(key, text):
    """Returns the conversions in the order of their values; numbered ones ("%2$s") may be in any order."""
    if key.startswith("host."):
        return []  # these have placeholders only
    found = [(match["number"], match[0]) for match in CONVERSION.finditer(PLACEHOLDER.sub("", text)) if match[0] != "%%"]
    if not any(number for number, _ in found):
        return [conversion for _, conversion in found]
    numbered = sorted((int((number or "0$")[:-1]), conversion.replace(number or "", "", 1)) for number, conversion in found)
    if [number for number, _ in numbered] != list(range(1, len(found) + 1)):
        return ["not numbered from 1 on"]
    return [conversion for _, conversion in numbered]


def check_entry(default, translation, key=""):
    """Returns what is wrong with a translation."""
    faults = []
    wanted, given = Counter(PLACEHOLDER.findall(default)), Counter(PLACEHOLDER.findall(translation))
    for name in sorted(set(wanted - given)):
        faults.append(f"{name} is lost")
    for name in sorted(set(given - wanted)):
        faults.append(f"{name} is not in the default text")
    conversions = [conversions_of(key, text) for text in (default, translation)]
    if conversions[0] != conversions[1]:
        faults.append(f"the conversions differ: {' '.join(conversions[0])} and {' '.join(conversions[1])}")
    accelerators = [bool(ACCELERATOR.search(text)) for text in (default, translation)]
    if accelerators[0] != accelerators[1]:
        faults.append("only one of the texts has an accelerator")
    if default.rstrip().endswith((".", ":")) and translation.rstrip()[-1:] not in tuple(".:。："):
        faults.append("the punctuation at the end is lost")
    return faults


def check(arguments):
    """Missing, unknown and outdated texts are only reported, unless all must be complete."""
    texts, faults = collect()
    notes = []
    for file in arguments.files:
        po = polib.pofile(str(file))
        try:
            language_of(po)
        except packs.PackError as error:
            faults.append(f"{file}: {error}")
        translated = set()
        for entry in po:
            if entry.obsolete or not entry.msgstr:
                continue
            place = f"{file}:{entry.linenum}: {entry.msgctxt}"
            text = texts.get(entry.msgctxt)
            if not text:
                notes.append(f"{place}: no such text")
                continue
            if entry.msgctxt in translated:
                faults.append(f"{place}: a second translation")
            faults.extend(f"{place}: {fault}" for fault in check_entry(text.default, entry.msgstr, entry.msgctxt))
            if entry.msgid != text.default:
                notes.append(f"{place}: the default text has changed: run translations.py update")
            elif not entry.fuzzy:
                translated.add(entry.msgctxt)
        notes.extend(f"{file}: {key} is not translated" for key in texts if key not in translated)
        print(f"{file}: {len(translated)} of {len(texts)} texts are translated")
    if arguments.complete:
        return faults + notes
    for note in notes:
        print(note)
    return faults


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    commands = parser.add_subparsers(required=True, metavar="COMMAND")

    def command(function, text, files=None):
        made = commands.add_parser(function.__name__, help=text, description=text)
        made.set_defaults(function=function)
        if files:
            made.add_argument("files", nargs="+", type=pathlib.Path, metavar="FILE", help=files)
        return made

    command(extract, "Collect all texts of the source code in po/tonewright.pot.").add_argument(
        "--check", action="store_true", help="only report whether that file is up to date"
    )
    command(update, "Bring .po files up to date with po/tonewright.pot.", "a .po file")
    command(pack, "Make language files from .po files.", "a .po file").add_argument(
        "-o", "--output", type=pathlib.Path, required=True, help="the folder for the language files"
    )
    command(unpack, "Make a .po file from the language files of one language.", "a language file").add_argument(
        "-o", "--output", type=pathlib.Path, required=True, help="the .po file"
    )
    command(check, "Check .po files: missing and unknown texts, placeholders, accelerators.", "a .po file").add_argument(
        "--complete", action="store_true", help="fail if a translation is missing or outdated"
    )
    arguments = parser.parse_args()
    try:
        faults = arguments.function(arguments)
    except (packs.PackError, OSError, UnicodeError) as error:
        faults = [str(error)]
    for fault in faults:
        print(fault, file=sys.stderr)
    return 1 if faults else 0


if __name__ == "__main__":
    sys.exit(main())
