"""Runs "info", "convert" and "tag" on a folder of sound files and compares the results with ffmpeg and mutagen.

Called by scripts/corpus.sh. Compared are rate, channels, length, samples and tag fields; after a changed title, all
other fields and the sound have to be the same as before. Files that the peer finds damaged only must not crash or hang.
"""

import argparse
import collections
import concurrent.futures
import json
import os
import pathlib
import re
import shutil
import subprocess
import sys
import tempfile

import mutagen
import mutagen.asf
import mutagen.id3

TIMEOUT = 300
FIELDS = ("title", "artist", "album", "album_artist", "genre", "comment", "track", "year")
ID3 = dict(zip(FIELDS, ("TIT2", "TPE1", "TALB", "TPE2", "TCON", "COMM", "TRCK", "TDRC")))
ASF = dict(zip(FIELDS, ("Title", "Author", "WM/AlbumTitle", "WM/AlbumArtist", "WM/Genre", "Description", "WM/TrackNumber", "WM/Year")))
VORBIS = dict(zip(FIELDS, ("title", "artist", "album", "albumartist", "genre", "comment", "tracknumber", "date")))
# Decoders of lossy codecs round differently, by up to two steps of the 16 bits that Tonewright delivers.
LOSSY_TOLERANCE = 2.5 / 32768
NEW_TITLE = "A title from the corpus check"


class Trouble(Exception):
    """A crash or a hang, which is a fault on any file."""


def run(*command):
    try:
        result = subprocess.run(command, stdin=subprocess.DEVNULL, capture_output=True, timeout=TIMEOUT)
    except subprocess.TimeoutExpired:
        raise Trouble(f"{command[1]} does not end within {TIMEOUT} s") from None
    if result.returncode < 0 or result.returncode in (134, 136, 139):
        raise Trouble(f"{command[1]} crashes ({result.returncode})")
    return result


def first_object(output):
    """The first JSON object that a command prints, and an empty one if it prints nothing."""
    lines = output.decode(errors="replace").splitlines()
    return json.loads(lines[0]) if lines else {}


def probe(file):
    """The first audio stream as ffprobe describes it, or None."""
    result = run("ffprobe", "-v", "error", "-select_streams", "a:0", "-of", "json",
                 "-show_entries", "stream=codec_name,sample_rate,channels", file)
    streams = json.loads(result.stdout or b"{}").get("streams", [])
    return streams[0] if streams else None


def decode(file, target):
    """Decodes to 32-bit samples in a W64 file; returns whether ffmpeg found nothing to complain about."""
    result = run("ffmpeg", "-v", "error", "-y", "-bitexact", "-i", file, "-map", "0:a:0", "-map_metadata", "-1",
                 "-c:a", "pcm_s32le", "-f", "w64", target)
    return result.returncode == 0 and not result.stderr


def count_frames(w64):
    return int(run("soxi", "-s", w64).stdout or 0)


def largest_difference(a, b, frames):
    """The largest difference of two samples, where 1.0 is full scale."""
    # Half of each, so that the mixture cannot clip.
    command = ["sox", "-m", "-v", "0.5", a, "-v", "-0.5", b, "-n", "trim", "0", f"{frames}s", "stat"]
    figures = dict(re.findall(r"(M\w+ amplitude):\s+(\S+)", run(*command).stderr.decode()))
    return 2 * max(abs(float(value)) for value in figures.values())


def read_fields(file):
    """Each field as a list of values, read by mutagen; None if mutagen does not know the format."""
    sound = mutagen.File(file)
    if sound is None:
        return None
    tags = sound.tags if sound.tags is not None else {}
    if isinstance(tags, mutagen.id3.ID3):
        values = {}
        for field, name in ID3.items():
            frames = tags.getall(name)
            if name == "COMM":  # ffmpeg writes a TXXX frame instead
                frames = [frame for frame in frames if not frame.desc] or frames or tags.getall("TXXX:comment")
            values[field] = [str(text) for frame in frames[:1] for text in (frame.genres if name == "TCON" else frame.text)]
    elif isinstance(tags, mutagen.asf.ASFTags):
        values = {field: [str(value) for value in tags.get(name, [])] for field, name in ASF.items()}
    elif type(sound).__name__ in ("WAVE", "AIFF", "MP4"):
        return None
    else:
        values = {field: [str(value) for value in tags.get(name, [])] for field, name in VORBIS.items()}
        values["comment"] = values["comment"] or list(tags.get("description", []))
    return values


def agrees(field, ours, theirs):
    """Formats with several values for a field join them in different ways."""
    if not theirs or not "".join(theirs):
        return not ours
    if field == "year":
        return ours[:4] == theirs[0][:4]
    if field == "track":
        return ours.split("/")[0].lstrip("0") == theirs[0].split("/")[0].lstrip("0")
    letters = lambda text: "".join(c for c in text if c.isalnum())
    return letters(ours) in (letters(theirs[0]), letters("".join(theirs)))


class Check:
    """All comparisons of one file. `counts` says what was done, `differences` what did not agree."""

    def __init__(self, program, readable, file, folder):
        self.program, self.file, self.folder = program, str(file), pathlib.Path(folder)
        self.supported = file.suffix[1:].lower() in readable
        self.counts, self.differences = [], []

    def differ(self, text):
        self.differences.append(text)

    def all(self):
        try:
            info = first_object(run(self.program, "info", "--json", self.file).stdout)
            stream = probe(self.file)
            if self.supported or "error" not in info:
                self.sound(info, stream)
                self.tags()
            else:
                self.counts.append("no supported extension")
        except Trouble as trouble:
            self.differ(str(trouble))
        except Exception as error:  # one strange file must not end the whole check
            self.differ(f"the check fails: {type(error).__name__}: {error}")
        return self

    def sound(self, info, stream):
        ours, theirs, again = (str(self.folder / name) for name in ("ours.wav", "theirs.w64", "ours.w64"))
        converted = run(self.program, "convert", "--json", "--no-tags", "--force", self.file, "-o", ours)
        whole = stream is not None and decode(self.file, theirs)
        if not whole:
            self.counts.append("damaged or no sound by ffmpeg")
            return
        if "error" in info or converted.returncode != 0:
            message = info.get("error") or converted.stderr.decode(errors="replace").strip()
            self.differ(f"only ffmpeg reads it: {message}")
            return
        self.counts.append("sound compared")
        for key, name in (("rate", "sample_rate"), ("channels", "channels")):
            if info[key] != int(stream[name]):
                self.differ(f"{key} is {info[key]}, by ffmpeg {stream[name]}")
                return
        decode(ours, again)
        frames, expected = count_frames(again), count_frames(theirs)
        if abs(info["duration"] * info["rate"] - frames) > 1.5:
            self.differ(f"info says {info['duration']} s, convert delivers {frames} frames of {info['rate']} Hz")
        if frames != expected:
            self.differ(f"{frames} frames, by ffmpeg {expected}")
        if pathlib.Path(again).read_bytes() == pathlib.Path(theirs).read_bytes():
            self.counts.append("samples identical")
            return
        codec = stream["codec_name"]
        lossless = codec in ("flac", "alac", "wavpack", "ape", "tta") or codec.startswith("pcm_")
        step = 2.0 ** (1 - int(info["bits"]))
        tolerance = (step * 1.5 if codec.startswith("pcm_f") else step / 4) if lossless else LOSSY_TOLERANCE
        difference = largest_difference(again, theirs, min(frames, expected)) if min(frames, expected) else 0.0
        if difference > tolerance:
            self.differ(f"samples differ by up to {difference:.6f} ({codec})")
        else:
            self.counts.append("samples within tolerance")

    def tags(self):
        shown = run(self.program, "tag", "show", "--json", self.file)
        ours = first_object(shown.stdout)
        try:
            before = read_fields(self.file)
        except mutagen.MutagenError:
            before = None
        if before is None:
            self.counts.append("tags not known to mutagen")
            return
        if "No tag is known" in ours.get("error", ""):
            self.counts.append("tags not supported")
            return
        if "error" in ours or shown.returncode != 0:
            self.differ(f"only mutagen reads the tags: {ours.get('error') or shown.stderr.decode(errors='replace').strip()}")
            return
        self.counts.append("tags compared")
        for field in FIELDS:
            if not agrees(field, ours.get(field, ""), before[field]):
                self.differ(f"{field} is {ours.get(field, '')!r}, by mutagen {before[field]!r}")
        self.store(before)

    def store(self, before):
        copy = str(self.folder / ("copy" + pathlib.Path(self.file).suffix))
        shutil.copyfile(self.file, copy)
        if run(self.program, "tag", "set", copy, "--title", NEW_TITLE).returncode != 0:
            self.counts.append("tags not stored")
            return
        self.counts.append("tags stored")
        after = read_fields(copy)
        for field in FIELDS:
            expected = [NEW_TITLE] if field == "title" else before[field]
            if after[field] != expected:
                self.differ(f"after a new title, {field} is {after[field]!r} and was {before[field]!r}")
        sums = [run("ffmpeg", "-v", "quiet", "-i", file, "-map", "0:a:0", "-c", "copy", "-f", "md5", "-").stdout for file in (self.file, copy)]
        if sums[0] != sums[1]:
            self.differ("a new title changes the sound")


def check(program, readable, file):
    with tempfile.TemporaryDirectory() as folder:
        return file, Check(program, readable, file, folder).all()


def main():
    parser = argparse.ArgumentParser(description=__doc__)
    parser.add_argument("program")
    parser.add_argument("folder", type=pathlib.Path)
    parser.add_argument("--jobs", type=int, default=os.cpu_count())
    arguments = parser.parse_args()

    os.environ["LC_ALL"] = "C.UTF-8"
    program = os.path.abspath(arguments.program)
    formats = first_object(run(program, "formats", "--json").stdout)
    readable = set(formats["read"])
    files = sorted(path for path in arguments.folder.rglob("*") if path.is_file())
    if not files:
        sys.exit(f"{arguments.folder}: no files")
    counts, bad = collections.Counter(), 0
    with concurrent.futures.ThreadPoolExecutor(arguments.jobs) as pool:
        for file, result in pool.map(lambda file: check(program, readable, file), files):
            counts.update(result.counts)
            bad += bool(result.differences)
            for text in result.differences:
                print(f"{file.relative_to(arguments.folder)}: {text}", flush=True)
    print(f"\n{len(files)} files, {bad} with differences")
    for name, count in sorted(counts.items()):
        print(f"  {count:6} {name}")
    sys.exit(1 if bad else 0)


if __name__ == "__main__":
    main()
