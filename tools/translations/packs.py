"""Reads and writes language files (*.zvrLang); the format is described in src/zvr_lang_manager/LanguageFile.h."""

import struct
from dataclasses import dataclass, field

SIGNATURE = b"URESFILE"
VERSION = 1
UNFINISHED = 1
AUTHOR = "ZVR_LANG_AUTHOR"
EXTENSION = ".zvrLang"


class PackError(Exception):
    pass


@dataclass
class Entry:
    key: str
    text: str
    default: str
    comment: str = ""
    unfinished: bool = False


@dataclass
class Pack:
    language: str  # such as "de-DE"
    english_name: str = ""
    native_name: str = ""
    application_id: str = ""
    application_name: str = ""
    comment: str = ""
    author: str = ""
    name: str = ""  # the only pack that the texts are for
    entries: list = field(default_factory=list)


def _string(text):
    units = text.encode("utf-16-le")
    return struct.pack("<I", len(units) // 2 + 1) + units + b"\0\0" if text else struct.pack("<I", 0)


def _strings(*texts):
    return b"".join(map(_string, texts))


def _chunk(chunk_id, body):
    return chunk_id + struct.pack("<q", len(body)) + body


def write(pack):
    data = struct.pack("<I", len(pack.entries))
    for entry in pack.entries:
        flags = UNFINISHED if entry.unfinished else 0
        data += struct.pack("<I", flags) + _strings(entry.key, entry.text, entry.default, entry.comment)
    block = _chunk(b"RSID", _string(pack.name)) if pack.name else b""
    block += _chunk(b"lang", _string(pack.language)) + _chunk(b"data", data)
    content = (
        _chunk(b"lang", _strings(pack.language, pack.english_name, pack.native_name))
        + _chunk(b"vers", struct.pack("<I", VERSION))
        + _chunk(b"apid", _strings(pack.application_id, pack.application_name))
        + _chunk(b"cmnt", _string(pack.comment))
        + _chunk(b"xdid", struct.pack("<I", 1) + _strings(AUTHOR, pack.author))
        + _chunk(b"STMP", block)
    )
    return SIGNATURE + struct.pack("<q", len(content)) + content


class _Reader:
    def __init__(self, data):
        self.data = data

    def take(self, size):
        if size < 0 or size > len(self.data):
            raise PackError("the language file is damaged or incomplete")
        taken, self.data = self.data[:size], self.data[size:]
        return taken

    def number(self):
        return struct.unpack("<I", self.take(4))[0]

    def size(self):
        return struct.unpack("<q", self.take(8))[0]

    def string(self):
        return self.take(2 * self.number()).decode("utf-16-le").rstrip("\0")

    def chunks(self):
        while len(self.data) >= 12:
            chunk_id = self.take(4)
            yield chunk_id, _Reader(self.take(self.size()))


def read(data):
    file = _Reader(data)
    if file.take(8) != SIGNATURE:
        raise PackError("not a language file")
    pack = Pack("")
    for chunk_id, body in _Reader(file.take(file.size())).chunks():
        if chunk_id == b"lang":
            pack.language, pack.english_name, pack.native_name = body.string(), body.string(), body.string()
        elif chunk_id == b"apid":
            pack.application_id, pack.application_name = body.string(), body.string()
        elif chunk_id == b"cmnt":
            pack.comment = body.string()
        elif chunk_id == b"xdid":
            values = dict((body.string(), body.string()) for _ in range(body.number()))
            pack.author = values.get(AUTHOR, "")
        elif chunk_id == b"STMP":
            for inner_id, inner in body.chunks():
                if inner_id == b"RSID":
                    pack.name = inner.string()
                elif inner_id == b"data":
                    for _ in range(inner.number()):
                        flags = inner.number()
                        key, text, default, comment = (inner.string() for _ in range(4))
                        pack.entries.append(Entry(key, text, default, comment, bool(flags & UNFINISHED)))
    return pack
