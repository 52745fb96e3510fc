"""Reads and writes tags with mutagen, to check ours against another implementation.

judge.py fields FILE...        prints the texts of each file as a list of JSON objects
judge.py set FILE JSON         sets such texts; a value may be a list
judge.py extras FILE           adds fields, frames and blocks that our tags do not support
judge.py broken FILE           adds pictures that cannot be decoded, to FLAC and Ogg
judge.py ape FILE              adds an APE tag
judge.py readape FILE          prints the items of an APE tag
judge.py pictures FILE         adds a picture of each type
judge.py types FILE            prints the types of all pictures
judge.py others FILE           prints everything in the tag except the texts, as JSON
"""
import base64
import hashlib
import json
import struct
import sys

import mutagen
from mutagen import apev2, asf, flac, id3
from mutagen.oggvorbis import OggVorbis

FIELDS = ["title", "artist", "album", "albumArtist", "trackNumber", "year", "genre", "comment"]
NAMES = {
    "id3": ["TIT2", "TPE1", "TALB", "TPE2", "TRCK", "TDRC", "TCON", "COMM::XXX"],
    "xiph": ["title", "artist", "album", "albumartist", "tracknumber", "date", "genre", "comment"],
    "asf": ["Title", "Author", "WM/AlbumTitle", "WM/AlbumArtist", "WM/TrackNumber", "WM/Year", "WM/Genre",
            "Description"],
}


def open_file(name):
    file = id3.ID3FileType(name) if name.endswith(".mp3") else mutagen.File(name)
    kind = "id3" if name.endswith(".mp3") else "asf" if isinstance(file, asf.ASF) else "xiph"
    if file.tags is None:
        file.add_tags()
    return file, kind


def as_texts(value):
    if isinstance(value, id3.TimeStampTextFrame):
        return [stamp.text for stamp in value.text]
    return [str(text) for text in (value.text if isinstance(value, id3.Frame) else value)]


def get_fields(name):
    file, kind = open_file(name)
    result = {}
    for field, key in zip(FIELDS, NAMES[kind]):
        if kind == "xiph" and field == "comment" and key not in file.tags:
            key = "description"  # the other name for it
        texts = as_texts(file.tags[key]) if key in file.tags else []
        result[field] = texts[0] if len(texts) == 1 else texts or ""
    return result


def set_fields(name, texts):
    file, kind = open_file(name)
    for field, key in zip(FIELDS, NAMES[kind]):
        text = texts.get(field, "")
        if not text:
            continue
        values = text if isinstance(text, list) else [text]
        if kind == "id3" and field == "comment":
            file.tags.add(id3.COMM(encoding=1, lang="deu", desc="", text=values))
        elif kind == "id3":
            file.tags.add(getattr(id3, key)(encoding=1, text=values))
        else:
            file.tags[key] = values
    file.save()


def add_extras(name):
    file, kind = open_file(name)
    picture = flac.Picture()
    picture.type, picture.mime, picture.desc, picture.data = 3, "image/png", "the front", b"\x89PNG front"
    second = flac.Picture()
    second.type, second.mime, second.desc, second.data = 8, "image/jpeg", "the artist", b"\xff\xd8 artist"
    texts = {"COMPOSER": "Somebody", "REPLAYGAIN_TRACK_GAIN": "-7.03 dB", "LYRICS": "la\nla"}
    if kind == "id3":
        file.tags.add(id3.TCOM(encoding=3, text=["Somebody", "Another"]))
        file.tags.add(id3.TXXX(encoding=3, desc="replaygain_track_gain", text=["-7.03 dB"]))
        file.tags.add(id3.USLT(encoding=3, lang="eng", desc="", text="la\nla"))
        file.tags.add(id3.COMM(encoding=3, lang="eng", desc="iTunNORM", text=["00000A"]))
        file.tags.add(id3.PRIV(owner="somebody", data=b"\x00\x01"))
        for entry in (picture, second):
            file.tags.add(id3.APIC(encoding=3, mime=entry.mime, type=entry.type, desc=entry.desc, data=entry.data))
    elif kind == "asf":
        file.tags["WM/Composer"] = ["Somebody", "Another"]
        file.tags["WM/Lyrics"] = ["la\nla"]
        file.tags["Copyright"] = ["nobody"]
        file.tags["replaygain_track_gain"] = ["-7.03 dB"]
        file.tags["WM/SharedUserRating"] = [asf.ASFDWordAttribute(75)]
        file.tags["large"] = [asf.ASFByteArrayAttribute(b"x" * 70000)]
    else:
        for key, value in texts.items():
            file.tags[key] = [value, value + " again"]
        if isinstance(file, OggVorbis):
            file.tags["metadata_block_picture"] = [
                base64.b64encode(entry.write()).decode() for entry in (picture, second)]
        else:
            file.add_picture(picture)
            file.add_picture(second)
            application = flac.MetadataBlock(b"testabcd")
            application.code = 2
            file.metadata_blocks.append(application)
    file.save()


def set_pictures(name):
    file, kind = open_file(name)
    values = []
    for number in range(21):
        picture = flac.Picture()
        picture.type, picture.mime, picture.desc, picture.data = number, "image/png", str(number), b"\x89PNG"
        if kind == "id3":
            file.tags.add(id3.APIC(encoding=3, mime=picture.mime, type=number, desc=picture.desc, data=picture.data))
        elif isinstance(file, flac.FLAC):
            file.add_picture(picture)
        elif kind == "asf":
            text = picture.mime.encode("utf-16-le") + b"\0\0" + picture.desc.encode("utf-16-le") + b"\0\0"
            data = struct.pack("<bi", number, len(picture.data)) + text + picture.data
            values.append(asf.ASFByteArrayAttribute(data))
        else:
            values.append(base64.b64encode(picture.write()).decode())
    if values:
        file.tags["WM/Picture" if kind == "asf" else "metadata_block_picture"] = values
    if kind == "id3":
        file.tags.add(id3.TDRC(encoding=3, text=["1999"]))
    elif kind == "asf":
        file.tags["WM/Year"], file.tags["WM/Track"] = [asf.ASFWordAttribute(1999)], [asf.ASFDWordAttribute(7)]
        file.tags["WM/Genre"] = [asf.ASFQWordAttribute(1 << 40)]
    else:
        file.tags["year"], file.tags["tracknum"] = ["1999"], ["7"]
    file.save()


def get_picture_types(name):
    file, kind = open_file(name)
    if kind == "id3":
        return [frame.type for frame in file.tags.getall("APIC")]
    if isinstance(file, flac.FLAC):
        return [picture.type for picture in file.pictures]
    if kind == "asf":
        return [value.value[0] for value in file.tags["WM/Picture"]]
    return [flac.Picture(base64.b64decode(value)).type for value in file.tags["metadata_block_picture"]]


def add_broken(name):
    file, _ = open_file(name)
    picture = b"\0\0\0\3\0\0\xff\xffbroken"
    if isinstance(file, OggVorbis):
        file.tags["metadata_block_picture"] = ["!not base64!", base64.b64encode(picture).decode()]
        file.tags["composer"] = ["Somebody"]
    else:
        block = flac.MetadataBlock(picture)
        block.code = 6
        file.metadata_blocks.append(block)
    file.save()


def get_others(name):
    file, kind = open_file(name)
    known = set(key.lower() for key in NAMES[kind])
    result = {}
    for key in file.tags.keys():
        if key.lower() in known or key == "WM/EncodingSettings":
            continue
        value = file.tags[key]
        if kind == "asf" and not str(value[0]):
            continue
        result[key] = hashlib.sha1(repr(value).encode()).hexdigest() + " " + repr(value)[:200]
    if isinstance(file, flac.FLAC):
        for number, block in enumerate(file.metadata_blocks):
            if block.code not in (1, 4):
                result["block %d" % number] = hashlib.sha1(block.write()).hexdigest()
    return result


command, name = sys.argv[1:3]
if command == "fields":
    print(json.dumps([get_fields(file) for file in sys.argv[2:]]))
elif command == "set":
    set_fields(name, json.loads(sys.argv[3]))
elif command == "extras":
    add_extras(name)
elif command == "ape":
    tag = apev2.APEv2()
    tag.update({"Title": "APE title", "Artist": "APE artist", "Track": "7/9", "replaygain_track_gain": "-3 dB"})
    tag.save(name)
elif command == "readape":
    print(json.dumps({key: str(value) for key, value in apev2.APEv2(name).items()}))
elif command == "pictures":
    set_pictures(name)
elif command == "types":
    print(json.dumps(get_picture_types(name)))
elif command == "broken":
    add_broken(name)
elif command == "others":
    print(json.dumps(get_others(name), indent=1, sort_keys=True))
