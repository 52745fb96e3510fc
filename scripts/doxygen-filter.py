#!/usr/bin/env python3
"""Prepares a file for Doxygen, as an input filter of docs/Doxyfile: doxygen-filter.py FILE

The plain comments of the C headers become Doxygen's. The headers are written to be read as they are, and their conventions carry over: a line "--- Title ---" starts a group, a
comment in front of a blank line is about the whole group, a comment behind code is about that code, and declarations that
follow each other without a blank line share the comment of the first. Line numbers do not change.

In a document, links to the headers become links to their pages, and links to other files plain text.
"""

import re
import sys


def declaration_starts(code):
    """The lines on which a declaration starts that is not part of another; `code` has no comments."""
    depth = 0
    is_complete = True
    for number, line in enumerate(code):
        text = line.strip()
        if not text or text.startswith(("#", 'extern "C"')) or (depth == 0 and text == "}"):
            continue
        if depth == 0 and is_complete:
            yield number
        depth += text.count("{") - text.count("}")
        is_complete = depth == 0 and text.endswith((";", "}"))


def convert_document(text):
    text = re.sub(r"\]\(\.\./include/tonewright/(\w+\.h)\)", r"](@ref \1)", text)
    return re.sub(r"\[([^\]]*)\]\([^:@)]*\)", r"\1", text)


def convert_header(text):
    lines = text.split("\n")
    offsets = [0]
    for line in lines:
        offsets.append(offsets[-1] + len(line) + 1)
    blank = lambda found: re.sub(r"[^\n]", " ", found[0])
    code = re.sub(r"/\*.*?\*/", blank, text, flags=re.S).split("\n")

    changes = []  # (offset, length, text)
    leading = {}  # comments in front of code, by the number of the line behind them
    group = ""
    for found in re.finditer(r"/\*(.*?)\*/", text, flags=re.S):
        first = text.count("\n", 0, found.start())
        last = text.count("\n", 0, found.end())
        before = code[first][: found.start() - offsets[first]].strip()
        section = re.fullmatch(r" --- (.*?) -+ ", found[1])
        if before.startswith("#") or before == "}":
            continue
        if section:
            end = "/** @} */ " if group else ""
            group = re.sub(r"\W+", "_", section[1].lower())
            title = section[1].replace(",", r"\,")
            changes.append((found.start(), len(found[0]), f"{end}/** @group{{{group},{title}}} @{{ */"))
            continue
        if first == 0:
            start = "/** @header "
        elif before:
            start = "/**< "
        elif group and not code[last + 1].strip():
            # Outside of the group, which then goes on.
            start = f"/** @}} */ /** @about{{{group}}} "
            changes.append((found.end() - len("*/"), 0, "@{ "))
        else:
            start = "/** "
            leading[last + 1] = " ".join(re.sub(r"\n \*", "\n", found[1]).split())
        changes.append((found.start(), len("/*"), start.rstrip()))
    if group:
        changes.append((len(text.rstrip()), 0, " /** @} */"))

    shared = ""
    for number in declaration_starts(code):
        if number in leading:
            shared = leading[number]
        elif not lines[number - 1].strip():
            shared = ""
        elif shared:
            changes.append((offsets[number], 0, f"/** {shared} */ "))
    for offset, length, replacement in sorted(changes, reverse=True):
        text = text[:offset] + replacement + text[offset + length :]
    return text


if __name__ == "__main__":
    convert = convert_document if sys.argv[1].endswith(".md") else convert_header
    with open(sys.argv[1], encoding="utf-8") as file:
        sys.stdout.write(convert(file.read()))
