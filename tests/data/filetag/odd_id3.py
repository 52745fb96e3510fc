"""ID3v2 tags that programs write although no library expects them.

odd_id3.py make SOUND FOLDER   writes MP3 files with such tags
odd_id3.py frames FILE...      prints what mutagen reads from each file, as JSON
"""
import json
import os
import struct
import sys
import zlib

from mutagen import id3

LONG = {"PIC": "APIC", "COM": "COMM", "GEO": "GEOB", "POP": "POPM", "ULT": "USLT", "TXX": "TXXX", "WXX": "WXXX",
        "UFI": "UFID", "TP1": "TPE1", "TP2": "TPE2", "TLE": "TLEN", "TFT": "TFLT", "TCO": "TCON", "TPB": "TPUB",
        "TYE": "TYER", "TDA": "TDAT", "TIM": "TIME"}
SHORT = {long: short for short, long in LONG.items()}
PICTURE = b"\x89PNG\xff\xfe\xff\xe0" + b"p" * 300


def small(number):
    return bytes(number >> shift & 127 for shift in (21, 14, 7, 0))


def frame(version, name, body, flags=b"\0\0", size=None):
    size = len(body) if size is None else size
    if version == 2:
        return SHORT[name].encode() + struct.pack(">I", size)[1:] + body
    return name.encode() + (struct.pack(">I", size) if version == 3 else small(size)) + flags + body


def tag(version, frames, flags=0, extended=b""):
    data = extended + frames + b"\0" * 64
    if flags & 0x80:
        data = data.replace(b"\xff", b"\xff\0")
    return b"ID3" + bytes([version, 0, flags]) + small(len(data)) + data


def many(version):
    picture = b"\0PNG\3desc\0" if version == 2 else b"\0image/png\0\3desc\0"
    frames = {"TPE1": b"\0Artist", "GEOB": b"\0app/x\0file\0desc\0" + bytes(range(256)), "TLEN": b"\0" + b"12345",
              "TFLT": b"\0MPG/3", "TCON": b"\0(17)Rock", "APIC": picture + PICTURE, "POPM": b"me\0\x80\0\0\0\7",
              "COMM": b"\0engdata\0note", "USLT": b"\0eng\0la la", "TXXX": b"\0key\0value",
              "WXXX": b"\0d\0http://x", "UFID": b"owner\0id\xff\xff"}
    return b"".join(frame(version, name, body) for name, body in frames.items())


def make_tags():
    utf16 = lambda text: b"\1" + text.encode("utf-16-le")
    for v in 2, 3, 4:
        yield "plain", tag(v, many(v))
        yield "no byte order mark", tag(v, frame(v, "TPE2", utf16("K\u00fcnstler")) + frame(
            v, "TXXX", utf16("k\u00e9y\0v\u00e4lue")) + many(v))
        for name, head, text, rest in (("APIC", b"PNG\3" if v == 2 else b"image/png\0\3", "d\u00e9\0", PICTURE), (
                "GEOB", b"app/x\0", "f\u00e9\0d\u00e9\0", b"data"), ("USLT", b"eng", "d\u00e9\0la", b""), (
                "WXXX", b"", "d\u00e9\0", b"http://x")):
            yield "no mark in " + name, tag(v, frame(v, name, b"\1" + head + utf16(text)[1:] + rest))
        yield "empty frame", tag(v, frame(v, "TPE2", b"") + many(v))
        yield "broken frame", tag(v, frame(v, "POPM", b"me") + many(v))
        yield "beyond the end", tag(v, many(v) + frame(v, "TPUB", b"\0publisher", size=5000))
        if v < 4:
            yield "year", tag(v, frame(v, "TYER", b"\0" + b"1999") + many(v))
            yield "unsynchronised", tag(v, many(v), 0x80)
            for day, time in (b"0104", b"1305"), (b"3112", b"0000"), (b"0101", b"2359"):
                yield "date", tag(v, frame(v, "TYER", b"\0" + b"1999") + frame(v, "TDAT", b"\0" + day) + frame(
                    v, "TIME", b"\0" + time) + many(v))
            for genre in b"17", b"(17)", b"(17)(4)Disco", b"((note", b"(CR)":
                yield "genre", tag(v, frame(v, "TCON", b"\0" + genre))
    others = b"".join(frame(3, name, body) for name, body in {
        "TORY": b"\0" + b"1980", "IPLS": b"\0role\0Name\0", "RVAD": b"\3\x10\1\2\3\4"}.items())
    yield "only in v2.3", tag(3, others + many(3))
    yield "extended header", tag(3, many(3), 0x40, struct.pack(">IHI", 6, 0, 0))
    yield "extended header with checksum", tag(3, many(3), 0x40, struct.pack(">IHII", 10, 0x8000, 0, 0x12345678))
    yield "extended header", tag(4, many(4), 0x40, small(6) + b"\1\0")
    yield "compressed", tag(3, frame(3, "TPE2", struct.pack(">I", 8) + zlib.compress(b"\0squeeze"), b"\0\x80") + many(3))
    yield "compressed", tag(4, frame(4, "TPE2", small(8) + zlib.compress(b"\0squeeze"), b"\0\x09") + many(4))
    yield "unsynchronised frame", tag(4, frame(4, "TPE2", b"\0\xff\0\xf0\xff\0", b"\0\x02") + many(4))
    yield "grouped", tag(3, frame(3, "TPE2", b"\7\0group", b"\0\x20") + many(3))
    yield "grouped", tag(4, frame(4, "TPE2", b"\7" + small(6) + b"\0group", b"\0\x41") + many(4))
    yield "linked picture", tag(2, frame(2, "APIC", b"\0-->\3desc\0http://x") + many(2))
    yield "other picture", tag(2, frame(2, "APIC", b"\0JPG\4jpeg\0" + PICTURE) + many(2))
    yield "to be discarded", tag(3, frame(3, "TPE2", b"\0alter", b"\x80\0") + many(3))
    yield "plain size", tag(4, frame(3, "TPE2", b"\0" + b"x" * 300) + frame(3, "TPE3", b"\0" + b"x" * 400))


def read_frames(name):
    tags = id3.ID3(name)
    result = {}
    for key, value in tags.items():
        end = 16 if key == "TDRC" else None  # without seconds
        text = [str(part)[:end] for part in value.text if part] if hasattr(value, "text") else None
        result[key] = text or repr(value).replace("Encoding.UTF16", "").replace("Encoding.LATIN1", "")
    return result


if sys.argv[1] == "make":
    sound = open(sys.argv[2], "rb").read()
    for number, (name, data) in enumerate(make_tags()):
        with open(os.path.join(sys.argv[3], "%d %s v2.%d.mp3" % (number, name, data[3])), "wb") as file:
            file.write(data + sound)
else:
    print(json.dumps([read_frames(name) for name in sys.argv[2:]]))
