#!/usr/bin/env python3
"""Compares the program with sox, ffmpeg, flac and lame, and prints tables for README.md: compare.py [BUILD_DIR [TABLE]]

TABLE is speed or results; both by default. Every cell comes from a run of the commands that are printed below the tables.
Ratios are Tonewright's processor time divided by the peer's, from alternating runs: below 1, Tonewright needs less. They hold
for one run on one machine.
"""

import itertools
import json
import os
import pathlib
import re
import shutil
import signal
import subprocess
import sys
import tempfile
import time
import wave

ROOT = pathlib.Path(__file__).resolve().parent.parent
sys.path.insert(0, str(ROOT / "bench/jobs"))
sys.dont_write_bytecode = True
import jobs

PEERS = ["sox", "ffmpeg", "flac", "lame"]
MINUTES, RUNS = 1, 3
RATE_48 = "aresample=48000:filter_size=16:phase_shift=10:linear_interp=0:exact_rational=0:cutoff=1.0:filter_type=kaiser:kaiser_beta=9"
SHOW_TAG = """
import sys, mutagen
for key, value in (mutagen.File(sys.argv[1]).tags or {}).items():
    print(key.lower(), str(value)[:80])
"""
commands = []


def note(title, command):
    words = [word.name if isinstance(word, pathlib.Path) else str(word) for word in command]
    line = f"{title}: {' '.join(words)}"
    if line not in commands:
        commands.append(line)


def convert(tool, source, target, *options):
    """The command of a plain conversion that may replace the target; None if the tool does not do such conversions."""
    kinds = (source.suffix, target.suffix)
    if tool == "tonewright":
        return [tool, "convert", "--force", "--quiet", source, "-o", target, *options]
    if tool == "sox":
        return [tool, "-V1", source, *options, target]
    if tool == "ffmpeg":
        return [tool, "-v", "error", "-y", "-i", source, *options, target]
    if tool == "flac" and kinds in ((".wav", ".flac"), (".flac", ".wav")):
        return [tool, "-s", "-f", *(["-d"] if kinds[0] == ".flac" else []), *options, source, "-o", target]
    if tool == "lame" and kinds in ((".wav", ".mp3"), (".mp3", ".wav")):
        return [tool, "--silent", *(["--decode"] if kinds[0] == ".mp3" else []), *options, source, target]
    return None


def speed(work, wav):
    """Rows of ratios, by peer."""
    flac, mp3 = work / "material.flac", work / "material.mp3"
    rows = [
        ("WAV to FLAC", wav, "o.flac", {"sox": ["-C", "5"], "ffmpeg": ["-compression_level", "5"], "flac": ["-5"]}, []),
        (
            "WAV to MP3, 192 kbit/s", wav, "o.mp3",
            {"sox": ["-C", "192"], "ffmpeg": ["-b:a", "192k"], "lame": ["--noreplaygain", "-b", "192"]}, ["--bitrate", "192k"],
        ),
        ("WAV to Ogg Vorbis", wav, "o.ogg", {"sox": ["-C", "5"], "ffmpeg": ["-c:a", "libvorbis", "-q:a", "5"]}, ["--quality", "0.5"]),
        ("FLAC to WAV", flac, "o.wav", {"sox": [], "ffmpeg": [], "flac": []}, []),
        ("MP3 to WAV", mp3, "o.wav", {"sox": [], "ffmpeg": [], "lame": []}, []),
        ("44.1 to 48 kHz, same filter", wav, "o.wav", {"ffmpeg": ["-af", RATE_48]}, ["--rate", "48000"]),
    ]
    for title, source, name, peers, options in rows:
        ours = convert("tonewright", source, work / name, *options)
        note(title, ours)
        cells = []
        for peer in PEERS:
            theirs = convert(peer, source, work / f"peer-{name}", *peers[peer]) if peer in peers else None
            if not theirs:
                cells.append("")
                continue
            note(title, theirs)
            pairs = [(jobs.run(ours), jobs.run(theirs)) for _ in range(RUNS)]
            mine, other = (jobs.best(column)[0] for column in zip(*pairs))
            cells.append(f"{mine / other:.2f}")
        yield title, cells


def quiet(command, **options):
    return subprocess.run(command, stdin=subprocess.DEVNULL, stdout=subprocess.DEVNULL, stderr=subprocess.DEVNULL, **options)


def is_old(target):
    return target.exists() and target.read_bytes() == b"old"


def frames(path):
    found = subprocess.run(["soxi", "-s", path], capture_output=True, text=True)
    return int(found.stdout or -1)


class Checks:
    """Questions with the answer yes (True), no, or None for a tool that does not do such a thing."""

    def __init__(self, work, wav):
        self.work, self.wav = work, wav
        self.short = work / "short.wav"
        subprocess.run(["sox", "-V1", wav, self.short, "trim", "0", "5"], check=True)
        subprocess.run(["lame", "--silent", self.short, work / "short.mp3"], check=True)
        self.tone = work / "tone.wav"
        subprocess.run(["sox", "-V1", "-n", "-r", "44100", "-c", "2", "-b", "24", self.tone, "synth", "5", "pinknoise"], check=True)
        cover = work / "cover.png"
        subprocess.run(["ffmpeg", "-v", "error", "-y", "-f", "lavfi", "-i", "color=red:s=64x64", "-frames:v", "1", cover], check=True)
        self.flac = work / "tone.flac"
        subprocess.run(["flac", "--totally-silent", "-f", "-T", "TITLE=A title", f"--picture={cover}", self.tone, "-o", self.flac], check=True)
        content = bytearray(self.flac.read_bytes())
        content[len(content) // 2 : len(content) // 2 + 4096] = bytes(4096)
        self.damaged = work / "damaged.flac"
        self.damaged.write_bytes(content)

    def damage_is_an_error(self, tool):
        command = convert(tool, self.damaged, self.work / "o.wav")
        return command and (quiet(command).returncode != 0, command)

    def damage_keeps_old_file(self, tool):
        target = self.work / "o.wav"
        command = convert(tool, self.damaged, target)
        target.write_text("old")
        return command and (quiet(command) and is_old(target), command)

    def stop_keeps_old_file(self, tool):
        target = self.work / ("o.mp3" if tool == "lame" else "o.flac")
        long = self.work / "long.wav"
        if not long.exists():
            with wave.open(str(self.wav)) as once, wave.open(str(long), "wb") as repeated:
                repeated.setparams(once.getparams())
                samples = once.readframes(once.getnframes())
                for _ in range(15):
                    repeated.writeframes(samples)
        command = convert(tool, long, target)
        target.write_text("old")
        process = subprocess.Popen(command, stdin=subprocess.DEVNULL, stdout=subprocess.DEVNULL, stderr=subprocess.DEVNULL)
        # On a busy machine a program may need long to start at all.
        stat = pathlib.Path(f"/proc/{process.pid}/stat")
        while is_old(target) and process.poll() is None and int(stat.read_text().split()[13]) < os.sysconf("SC_CLK_TCK"):
            time.sleep(0.01)
        if process.poll() is not None:
            sys.exit(f"compare.py: {tool} was done before it was stopped")
        process.send_signal(signal.SIGINT)
        process.wait()
        return is_old(target), ["timeout", "-s", "INT", "1", *command]

    def keeps_24_bits(self, tool):
        command = convert(tool, self.flac, self.work / "o.wav")
        if not command:
            return None
        quiet(command)
        bits = subprocess.run(["soxi", "-b", self.work / "o.wav"], capture_output=True, text=True).stdout.strip()
        return bits == "24", command

    def mp3_has_exact_length(self, tool):
        mp3 = self.work / "short.mp3"
        command = convert(tool, mp3, self.work / "o.wav")
        if not command:
            return None
        quiet(command)
        return frames(self.work / "o.wav") == frames(self.short), command

    def reads_unfinished_wav(self, tool):
        unfinished = self.work / "unfinished.wav"
        content = bytearray(self.short.read_bytes())
        data = content.index(b"data")
        content[4:8] = content[data + 4 : data + 8] = bytes(4)
        unfinished.write_bytes(content)
        target = self.work / ("o.mp3" if tool == "lame" else "o.flac")
        target.unlink(missing_ok=True)
        command = convert(tool, unfinished, target)
        quiet(command)
        return abs(frames(target) - frames(self.short)) < 4608, command

    def keeps_tag(self, tool, extension):
        target = self.work / f"tagged.{extension}"
        command = convert(tool, self.flac, target)
        if not command:
            return None
        target.unlink(missing_ok=True)
        quiet(command)
        # Debian's interpreter has the module; another one in the path may not.
        shown = subprocess.run(["/usr/bin/python3", "-c", SHOW_TAG, target], capture_output=True, text=True, check=True)
        return "A title" in shown.stdout and re.search("apic|metadata_block_picture", shown.stdout) is not None, command

    def rows(self):
        questions = [
            ("Damaged FLAC ends with an error", self.damage_is_an_error),
            ("Then an existing target stays as it was", self.damage_keeps_old_file),
            ("It also does if the job is stopped with Ctrl-C", self.stop_keeps_old_file),
            ("Title and cover reach MP3, from FLAC", lambda tool: self.keeps_tag(tool, "mp3")),
            ("Title and cover reach Ogg Vorbis, from FLAC", lambda tool: self.keeps_tag(tool, "ogg")),
            ("24 bits stay 24 bits, FLAC to WAV", self.keeps_24_bits),
            ("MP3 decodes to the length that was encoded", self.mp3_has_exact_length),
            ("WAV without sizes, of a killed recorder, is read", self.reads_unfinished_wav),
        ]
        for title, question in questions:
            cells = []
            for tool in ["tonewright", *PEERS]:
                answer = question(tool)
                cells.append("" if not answer else "yes" if answer[0] else "no")
                if answer:
                    note(title, answer[1])
            yield title, cells


def count_formats():
    listing = json.loads(subprocess.run(["tonewright", "formats", "--json"], capture_output=True, text=True, check=True).stdout)
    note("File types that are read", ["tonewright", "formats"])
    sox = subprocess.run(["sox", "--help"], capture_output=True, text=True).stdout
    note("File types that are read", ["sox", "--help", "|", "grep", "FORMATS:"])
    demuxers = subprocess.run(["ffmpeg", "-v", "error", "-demuxers"], capture_output=True, text=True).stdout
    note("File types that are read", ["ffmpeg", "-demuxers"])
    names = next(line for line in sox.splitlines() if line.startswith("AUDIO FILE FORMATS:"))
    return [len(listing["read"]), len(names.split(":")[1].split()), len([line for line in demuxers.splitlines() if line[1:3] == "D "]), 1, 1]


def table(head, rows):
    print(f"\n| {' | '.join(head)} |\n|{'---|' * len(head)}")
    for title, cells in rows:
        print(f"| {title} | {' | '.join(str(cell) or '·' for cell in cells)} |", flush=True)


def main():
    for tool in PEERS:
        if not shutil.which(tool):
            sys.exit(f"{tool} is missing: run scripts/setup.sh")
    build = pathlib.Path(sys.argv[1] if len(sys.argv) > 1 else ROOT / "build/release").resolve()
    os.environ["PATH"] = f"{build / 'bin'}:{os.environ['PATH']}"
    material = build / f"bench-{MINUTES}min"  # shared with scripts/bench.sh
    material.mkdir(exist_ok=True)
    jobs.make_material(material, MINUTES)
    with tempfile.TemporaryDirectory() as folder:
        work = pathlib.Path(folder)
        for name in ("material.wav", "material.flac", "material.mp3"):
            work.joinpath(name).symlink_to(material / name)
        wav = work / "material.wav"
        wanted = sys.argv[2:] or ["speed", "results"]
        if "speed" in wanted:
            table(["Processor time, Tonewright / peer", *PEERS], speed(work, wav))
        if "results" in wanted:
            rows = itertools.chain(Checks(work, wav).rows(), [("File types read", count_formats())])
            table(["", "tonewright", *PEERS], rows)
    print("\nThe commands:\n", *commands, sep="\n")


if __name__ == "__main__":
    main()
