#!/usr/bin/env python3
"""Compares whole jobs with peer programs in the same run: ratios of processor and wall time, and peak memory.

Called by scripts/bench.sh with the build folder. A ratio below 1 means that Tonewright needs less than the peer.
"""

import argparse
import os
import pathlib
import shutil
import subprocess
import sys
import tempfile
import time

from playing import bench_playing
from startup import bench_startup

SOUNDS = sorted(pathlib.Path("/usr/share/sounds/alsa").glob("*.wav")) + sorted(
    pathlib.Path("/usr/share/sounds/freedesktop/stereo").glob("*.oga")
)
RATE = 44100


def run(command):
    """Runs a command; returns processor seconds, wall seconds and peak resident KiB."""
    # A direct child of this process would inherit its peak memory; "time" is a small process.
    with tempfile.NamedTemporaryFile() as report:
        start = time.perf_counter()
        result = subprocess.run(
            ["/usr/bin/time", "-o", report.name, "-f", "%U %S %M", *command],
            stdin=subprocess.DEVNULL,
            stdout=subprocess.DEVNULL,
            stderr=subprocess.DEVNULL,
        )
        wall = time.perf_counter() - start
        if result.returncode != 0:
            sys.exit(f"failed ({result.returncode}): {' '.join(map(str, command))}")
        user, system, peak = report.read().split()
    return float(user) + float(system), wall, int(peak)


def best(results):
    """The minimum of each figure over all runs, which is least affected by other load."""
    return tuple(min(column) for column in zip(*results))


def show(*commands):
    """Prints commands with file names only, so that a row says what both sides do."""
    for command in commands:
        words = [word.name if isinstance(word, pathlib.Path) else word for word in command]
        words = ["SCRIPT" if "\n" in word else word for word in words]
        print("    " + " ".join(words[:14]) + (f" ... ({len(words) - 14} more)" if len(words) > 14 else ""), flush=True)


def make_material(work, minutes):
    """Concatenates real recordings, repeats them up to the wanted length, and encodes the result."""
    wav = work / "material.wav"
    # What exists is complete: it is written to another name, with the same extension, and then renamed.
    partial = lambda path: path.with_name(f"partial-{path.name}")
    if not wav.exists():
        parts = []
        for i, sound in enumerate(SOUNDS):
            part = work / f"part{i}.wav"
            subprocess.run(["ffmpeg", "-v", "error", "-y", "-i", sound, "-ar", str(RATE), "-ac", "2", part], check=True)
            parts.append(part)
        once = work / "once.wav"
        subprocess.run(["sox", *parts, "-b", "16", once], check=True)
        seconds = float(subprocess.check_output(["soxi", "-D", once]))
        subprocess.run(["sox", once, partial(wav), "repeat", str(int(minutes * 60 / seconds) + 1), "trim", "0", str(minutes * 60)], check=True)
        partial(wav).rename(wav)
        for part in parts + [once]:
            part.unlink()
    for name, command in {
        "material.flac": ["flac", "-s", "-f", wav, "-o"],
        "material.mp3": ["lame", "--silent", "-b", "192", wav],
    }.items():
        if not (work / name).exists():
            subprocess.run([*command, partial(work / name)], check=True)
            partial(work / name).rename(work / name)
    return wav


def sparse_silence(path, seconds):
    """Writes a WAV file of silence as a sparse file."""
    size = seconds * RATE * 4
    header = b"RIFF" + (size + 36).to_bytes(4, "little") + b"WAVEfmt " + (16).to_bytes(4, "little")
    header += (1).to_bytes(2, "little") + (2).to_bytes(2, "little") + RATE.to_bytes(4, "little")
    header += (RATE * 4).to_bytes(4, "little") + (4).to_bytes(2, "little") + (16).to_bytes(2, "little")
    header += b"data" + size.to_bytes(4, "little")
    with open(path, "wb") as file:
        file.write(header)
        file.truncate(len(header) + size)


# Reads every field of every file, as "tonewright tag show" does.
MUTAGEN_SHOW = """
import sys, mutagen
for name in sys.argv[1:]:
    tags = mutagen.File(name).tags
    print(name, {key: str(tags[key]) for key in tags.keys()} if tags else None)
"""
PROBE_SHOW = 'for file; do ffprobe -v error -of json -show_entries format_tags:stream_tags "$file"; done'
TAG_FILES, PROBE_FILES = 1000, 20


def compare(title, repeat, ours, peer, theirs, prepare=lambda: None):
    """Prints one line of ratios. A command may be a function that returns a new command for each run."""
    pairs = []
    for _ in range(repeat):
        pair = []
        for command in (ours, theirs):
            prepare()
            pair.append(run(command() if callable(command) else command))
        pairs.append(pair)
    mine, other = best([a for a, _ in pairs]), best([b for _, b in pairs])
    ratio = lambda i: f"{mine[i] / other[i]:6.3f}" if other[i] > 0 else "     -"
    print(f"{title:40} {peer:8} {ratio(0)} {ratio(1)} {mine[1] * 1000:9.0f} {other[1] * 1000:9.0f}", flush=True)
    show(*(command() if callable(command) else command for command in (ours, theirs)))


def bench_tags(host, work, wav, repeat):
    print(f"\n{'tags':40} {'peer':8} {'CPU':>6} {'wall':>6} {'ms':>9} {'peer ms':>9}")
    folder = work / "tags"
    shutil.rmtree(folder, ignore_errors=True)
    folder.mkdir()
    fields = [f"{key}={key} of a sound" for key in ("title", "artist", "album", "album_artist", "genre", "comment")] + ["track=3", "date=1999"]
    metadata = [word for field in fields for word in ("-metadata", field)]
    for extension in ("flac", "mp3", "ogg", "wav", "wma"):
        first = folder / f"0.{extension}"
        subprocess.run(["ffmpeg", "-v", "error", "-y", "-t", "2", "-i", wav, *metadata, first], check=True)
        files = [first]
        for i in range(1, TAG_FILES):
            files.append(folder / f"{i}.{extension}")
            shutil.copyfile(first, files[-1])
        title = f"show, {TAG_FILES} {extension} files"
        ours = [host, "tag", "show", "--json", *files]
        compare(title, repeat, ours, "mutagen", ["/usr/bin/python3", "-c", MUTAGEN_SHOW, *files])
        # ffprobe takes one file per process, so it gets fewer files.
        few = files[:PROBE_FILES]
        compare(f"show, {PROBE_FILES}", repeat, [host, "tag", "show", "--json", *few], "ffprobe", ["sh", "-c", PROBE_SHOW, "sh", *few])

    counter = iter(range(1000000))
    text = lambda: f"title {next(counter):06}"
    noise = folder / "noise.wav"
    subprocess.run(["sox", "-V1", "-n", "-r", str(RATE), "-c", "2", "-b", "16", noise, "synth", "290", "whitenoise"], check=True)
    for name, padding in (("padded", "--padding=8192"), ("tight", "--no-padding")):
        subprocess.run(["flac", "-s", "-f", "-0", padding, noise, "-o", folder / f"{name}.flac"], check=True)
    padded, tight, copy, out = (folder / f"{name}.flac" for name in ("padded", "tight", "copy", "out"))
    set_title = lambda file: lambda: [host, "tag", "set", file, "--title", text()]
    compare(
        f"set, FLAC of {padded.stat().st_size // 1000000} MB with padding", max(repeat, 5), set_title(padded),
        "metaflac", lambda: ["metaflac", "--remove-tag=TITLE", f"--set-tag=TITLE={text()}", padded],
    )
    compare(
        "set, the same without padding", max(repeat, 5), set_title(copy),
        "cp", ["cp", tight, out], prepare=lambda: shutil.copyfile(tight, copy),
    )
    compare(
        "set, the same without padding", max(repeat, 5), set_title(copy),
        "cp, sync", ["sh", "-c", 'cp "$0" "$1" && sync "$1"', tight, out], prepare=lambda: shutil.copyfile(tight, copy),
    )
    shutil.rmtree(folder)


def make_tracks(work, wav, minutes, count):
    """Makes stereo files, each the material rotated by a different offset."""
    files = []
    for i in range(count):
        files.append(work / f"track{i}.wav")
        shift = minutes * 60 * (i + 1) / (count + 1)
        subprocess.run(["sox", f"|sox {wav} -p trim {shift}", f"|sox {wav} -p trim 0 {shift}", "-b", "16", files[-1]], check=True)
    return files


def write_arrangement(path, files, seconds):
    track = "<Track><SourceEndTime>{}</SourceEndTime><Uri>{}</Uri></Track>"
    tracks = "".join(track.format(seconds, file.name) for file in files)
    path.write_text(f'<?xml version="1.0" encoding="utf-8"?><Project><Tracks>{tracks}</Tracks></Project>')


def bench_mixing(host, work, wav, minutes, repeat):
    """Mixes up to 32 files, each a fifth of the material's length."""
    part = work / "part.wav"
    seconds = minutes * 12
    subprocess.run(["sox", wav, part, "trim", "0", str(seconds)], check=True)
    files = make_tracks(work, part, minutes / 5, 32)
    arrangement, out = work / "mix.xml", work / "o.wav"
    ours = [host, "mix", "--force", "--quiet", arrangement, "-o", out]
    inputs = [word for file in files[:8] for word in ("-i", file)]
    print(f"\n{f'mixing {minutes / 5:g} minutes':40} {'peer':8} {'CPU':>6} {'wall':>6} {'ms':>9} {'peer ms':>9}")
    write_arrangement(arrangement, files[:8], seconds)
    for peer, command in (
        ("sox", ["sox", "-m", *files[:8], out]),
        ("ffmpeg", ["ffmpeg", "-v", "error", "-y", *inputs, "-filter_complex", "amix=inputs=8", out]),
    ):
        compare("8 stereo WAV to WAV", repeat, ours, peer, command)
    print("Wall and processor time of each track:")
    for count in (2, 8, 32):
        write_arrangement(arrangement, files[:count], seconds)
        cpu, wall, peak = best([run(ours) for _ in range(repeat)])
        print(f"  {count:2} tracks {wall / count * 1000:6.1f} ms {cpu / count * 1000:6.1f} ms, {peak / 1024:.1f} MiB in all", flush=True)
    for leftover in (*files, part, arrangement, out):
        leftover.unlink()


def bench_discs(host, work, wav, repeat):
    """Rips an image of ten tracks, and builds a disc image of 400 files of 1 MB."""
    folder = work / "discs"
    shutil.rmtree(folder, ignore_errors=True)
    files = folder / "files"
    files.mkdir(parents=True)
    for i in range(400):
        (files / f"{i}.bin").write_bytes(os.urandom(1000000))
    subprocess.run(["sox", wav, "-t", "raw", "-e", "signed", "-b", "16", "-L", folder / "disc.bin"], check=True)
    count = (folder / "disc.bin").stat().st_size // 2352
    sheet = 'FILE "disc.bin" BINARY\n'
    for i in range(10):
        start = count // 10 * i
        sheet += f"TRACK {i + 1:02} AUDIO\nINDEX 01 {start // 4500:02}:{start // 75 % 60:02}:{start % 75:02}\n"
    cue, iso, other = folder / "disc.cue", folder / "o.iso", folder / "p.iso"
    cue.write_text(sheet)
    print(f"\n{'discs':40} {'peer':8} {'CPU':>6} {'wall':>6} {'ms':>9} {'peer ms':>9}")
    rip = [host, "rip", cue, "--to", "flac", "--force", "--quiet", "-d", folder / "ripped"]
    compare("rip an image, 10 tracks", repeat, rip, "flac", ["flac", "-s", "-f", "-5", wav, "-o", folder / "p.flac"])
    burn = [host, "burn", files, "--image", iso, "--force", "--quiet"]
    xorriso = ["xorriso", "-as", "mkisofs", "-quiet", "-J", "-R", "-o", other, files]
    compare("ISO of 400 MB, read back", repeat, burn, "xorriso", xorriso)
    script = 'out="$1"; shift; "$@" && sync "$out" && cat "$out"'
    compare("ISO of 400 MB; synced, read", repeat, burn, "xorriso", ["sh", "-c", script, "sh", other, *xorriso])
    shutil.rmtree(folder)


def main():
    parser = argparse.ArgumentParser(description=__doc__)
    parser.add_argument("build", type=pathlib.Path)
    parser.add_argument("--minutes", type=int, default=10, help="length of the material")
    parser.add_argument("--repeat", type=int, default=3, help="runs of each job, interleaved with its peer")
    parser.add_argument("--only", default="", help="only jobs whose name contains this text; \"start-up\", \"tags\", \"mixing\", \"discs\" and \"playing\" select those groups")
    arguments = parser.parse_args()

    host = arguments.build / "bin/tonewright"
    work = arguments.build / f"bench-{arguments.minutes}min"
    work.mkdir(exist_ok=True)
    wav = make_material(work, arguments.minutes)
    ours = lambda *options: [host, "convert", "--force", "--quiet", *options]
    out = lambda name: work / name
    alone = lambda command: ["env", "TONEWRIGHT_THREADS=1", *command]
    flac, mp3 = work / "material.flac", work / "material.mp3"
    picture = "showwavespic=s=1200x300:split_channels=1"
    rate48 = "aresample=48000:filter_size=16:phase_shift=10:linear_interp=0:exact_rational=0:cutoff=1.0:filter_type=kaiser:kaiser_beta=9"

    jobs = [
        ("WAV to FLAC", ours(wav, "-o", out("o.flac")), "flac", ["flac", "-s", "-f", "-5", wav, "-o", out("p.flac")]),
        ("WAV to FLAC, 1 thread", alone(ours(wav, "-o", out("o.flac"))), "flac", ["flac", "-s", "-f", "-5", wav, "-o", out("p.flac")]),
        ("WAV to MP3, CBR 192", ours(wav, "-o", out("o.mp3"), "--bitrate", "192000"), "lame", ["lame", "--silent", "--noreplaygain", "-b", "192", wav, out("p.mp3")]),
        ("WAV to MP3, VBR", ours(wav, "-o", out("v.mp3"), "--quality", "0.8"), "lame", ["lame", "--silent", "--noreplaygain", "-V", "2", wav, out("pv.mp3")]),
        ("WAV to Ogg Vorbis", ours(wav, "-o", out("o.ogg"), "--quality", "0.5"), "oggenc", ["oggenc", "-Q", "-q", "5", wav, "-o", out("p.ogg")]),
        ("FLAC to WAV", ours(flac, "-o", out("f.wav")), "ffmpeg", ["ffmpeg", "-v", "error", "-y", "-i", flac, out("pf.wav")]),
        ("MP3 to WAV", ours(mp3, "-o", out("m.wav")), "ffmpeg", ["ffmpeg", "-v", "error", "-y", "-i", mp3, out("pm.wav")]),
        ("FLAC to WAV", ours(flac, "-o", out("f.wav")), "flac", ["flac", "-s", "-f", "-d", flac, "-o", out("pf.wav")]),
        ("MP3 to WAV", ours(mp3, "-o", out("m.wav")), "mpg123", ["mpg123", "-q", "-w", out("pm.wav"), mp3]),
        ("waveform of FLAC", [host, "waveform", "--force", flac, "-o", out("w.png")], "ffmpeg", ["ffmpeg", "-v", "error", "-y", "-i", flac, "-filter_complex", picture, "-frames:v", "1", out("pw.png")]),
        ("waveform of FLAC, 1 thread", alone([host, "waveform", "--force", flac, "-o", out("w.png")]), "flac -t", ["flac", "-s", "-t", flac]),
        ("loudness of FLAC", [host, "loudness", flac], "ffmpeg", ["ffmpeg", "-v", "error", "-i", flac, "-af", "ebur128=peak=true", "-f", "null", "-"]),
        ("WAV 44.1 to 48 kHz", ours(wav, "-o", out("r.wav"), "--rate", "48000"), "ffmpeg", ["ffmpeg", "-v", "error", "-y", "-i", wav, "-af", rate48, out("pr.wav")]),
    ]
    print(f"{'job':26} {'peer':8} {'CPU':>6} {'wall':>6} {'x real time':>12} {'peak MiB':>9} {'peer MiB':>9}")
    for name, our_command, peer, peer_command in jobs:
        if arguments.only.lower() not in name.lower():
            continue
        pairs = [(run(our_command), run(peer_command)) for _ in range(arguments.repeat)]
        mine, theirs = best([a for a, _ in pairs]), best([b for _, b in pairs])
        print(
            f"{name:26} {peer:8} {mine[0] / theirs[0]:6.2f} {mine[1] / theirs[1]:6.2f} "
            f"{arguments.minutes * 60 / mine[1]:12.0f} {mine[2] / 1024:9.1f} {theirs[2] / 1024:9.1f}",
            flush=True,
        )
        show(our_command, peer_command)

    if arguments.only.lower() in "start-up":
        bench_startup(host, work)
    if arguments.only.lower() in "tags":
        bench_tags(host, work, wav, arguments.repeat)
    if arguments.only.lower() in "mixing":
        bench_mixing(host, work, wav, arguments.minutes, arguments.repeat)
    if arguments.only.lower() in "discs":
        bench_discs(host, work, wav, arguments.repeat)
    if arguments.only.lower() in "playing":
        bench_playing(host, work, wav, run)
    if not arguments.only:
        print("\nPeak memory by length, WAV to FLAC:")
        for title, seconds in (("1 minute", 60), ("6 hours", 6 * 3600)):
            silence = out("silence.wav")
            sparse_silence(silence, seconds)
            _, wall, peak = run(ours(silence, "-o", out("silence.flac")))
            print(f"  {title:10} {peak / 1024:6.1f} MiB in {wall:.2f} s")
            silence.unlink()
    for leftover in ("o.flac", "p.flac", "o.mp3", "p.mp3", "v.mp3", "pv.mp3", "o.ogg", "p.ogg", "f.wav", "pf.wav", "m.wav", "pm.wav", "r.wav", "pr.wav", "w.png", "pw.png", "silence.flac"):
        (work / leftover).unlink(missing_ok=True)


if __name__ == "__main__":
    for tool in ("flac", "metaflac", "lame", "mpg123", "oggenc", "ffmpeg", "sox", "xorriso"):
        if not shutil.which(tool):
            sys.exit(f"{tool} is missing: run scripts/setup.sh")
    main()
