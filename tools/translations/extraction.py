"""Finds the texts of the program in its source code.

A text is a key, such as "peru.CFileNotFoundError.Desc", followed by the default text: as arguments of a function, as
members of an initialiser, or chosen with ?: in both places. Adjacent literals are one text.
"""

import re
from dataclasses import dataclass, field

SUFFIXES = {".cpp", ".h"}
KEY = re.compile(
    r"(?:peru|sonora2|filetag|freedb|disciopp|tonewright|zvr_lang|host|graphics|ced"
    r"|CGraphicShape|CFreeForm[A-Za-z]*)(?:\.[A-Za-z0-9_]+)+"
)
TOKEN = re.compile(
    r"""//[^\n]*|/\*.*?\*/            # comments
      | R"(?P<tag>[^(\s]*)\(.*?\)(?P=tag)"
      | (?:u8|[uUL])?"(?P<text>(?:\\.|[^"\\\n])*)"
      | '(?:\\.|[^'\\])+'
      | [A-Za-z_0-9]+ | \S""",
    re.VERBOSE | re.DOTALL,
)
ESCAPES = {"n": "\n", "t": "\t", "r": "\r", "0": "\0", '"': '"', "'": "'", "\\": "\\"}


@dataclass
class Text:
    """A default text and where the source uses it."""

    key: str
    default: str
    places: list = field(default_factory=list)  # (file, line)


@dataclass
class Token:
    value: str
    line: int
    is_literal: bool


def _unescape(text):
    return re.sub(r"\\(.)", lambda match: ESCAPES.get(match[1], match[0]), text)


def _tokens(source):
    tokens = []
    line, last = 1, 0
    for match in TOKEN.finditer(source):
        line += source.count("\n", last, match.start())
        last = match.start()
        if match[0].startswith(("//", "/*")):
            continue
        if match["text"] is None:
            tokens.append(Token(match[0], line, False))
        elif tokens and tokens[-1].is_literal:
            tokens[-1].value += _unescape(match["text"])
        else:
            tokens.append(Token(_unescape(match["text"]), line, True))
    return tokens


def _pairs(tokens):
    """Yields (key token, default text), or (key token, None) for a key without a text."""
    taken = set()
    for i, token in enumerate(tokens):
        if i in taken or not token.is_literal or not KEY.fullmatch(token.value):
            continue
        behind = tokens[i + 1 : i + 40]
        values = [each.value if not each.is_literal else None for each in behind]
        if values[:1] == [","] and len(behind) > 1 and behind[1].is_literal:
            yield token, behind[1].value
        elif values[:2] == [":", None] and KEY.fullmatch(behind[1].value) and "?" in values:
            # condition ? "key" : "key", condition ? "text" : "text"
            first = values.index("?")
            yield token, behind[first + 1].value if behind[first + 1].is_literal else None
            yield behind[1], behind[first + 3].value if behind[first + 3].is_literal else None
            taken.add(i + 2)
        elif not token.value.endswith(".") and values[:1] in ([","], [":"]):
            yield token, None


def collect(root, folders):
    """Returns the texts by key, sorted, and a list of faults in the source."""
    texts, faults = {}, []
    files = sorted(file for name in folders for file in (root / name).rglob("*") if file.suffix in SUFFIXES)
    for file in files:
        name = file.relative_to(root).as_posix()
        for token, default in _pairs(_tokens(file.read_text(encoding="utf-8"))):
            place = (name, token.line)
            if default is None:
                faults.append(f"{name}:{token.line}: the key '{token.value}' has no text")
                continue
            text = texts.setdefault(token.value, Text(token.value, default))
            text.places.append(place)
            if text.default != default:
                known = "{}:{}".format(*text.places[0])
                faults.append(f"{name}:{token.line}: the key '{token.value}' has another text in {known}")
    return dict(sorted(texts.items())), faults
