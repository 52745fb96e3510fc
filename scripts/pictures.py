#!/usr/bin/env python3
"""Draws the pictures of README.md, in docs/images: pictures.py [BUILD_DIR]

The waveform is drawn by the program, from a piece that is computed here. The terminal shows what the program really prints
when it works on that piece.
"""

import array
import fcntl
import html
import math
import os
import pathlib
import pty
import random
import re
import struct
import subprocess
import sys
import tempfile
import termios
import wave

ROOT = pathlib.Path(__file__).resolve().parent.parent
RATE = 44100
COLUMNS = 100


def pluck(frequency, seconds, level, noise):
    """A plucked string: noise in a delay line with a damping filter."""
    period = round(RATE / frequency)
    line = [noise.uniform(-level, level) for _ in range(period)]
    samples = array.array("d")
    damping = 0.999 if frequency < 200 else 0.997
    length = int(seconds * RATE)
    for i in range(length):
        at = i % period
        samples.append(line[at] * min(1, 2 * (length - i) / length))
        line[at] = damping * 0.5 * (line[at] + line[(at + 1) % period])
    return samples


def compose(bars, transposition):
    """Broken chords that rise and fall in level over a bass, with a rest before the last one."""
    noise = random.Random(transposition)
    chords = [(0, 7, 12, 15), (-4, 3, 8, 12), (3, 10, 15, 19), (-2, 5, 10, 14)]
    step = 0.25
    length = int((bars * 8 * step + 3) * RATE)
    left, right = array.array("d", bytes(8 * length)), array.array("d", bytes(8 * length))
    for bar in range(bars):
        is_last = bar == bars - 1
        swell = 1 if is_last else 0.2 + 0.8 * math.sin(math.pi * (bar % 4 + 0.5) / 4) ** 2
        chord = chords[bar % 4]
        notes = [(0, chord[0] - 12, 0.8, 2.5)]
        if is_last:
            notes += [(2 + i * 0.1, tone, 0.6, 3) for i, tone in enumerate(chord)]
        else:
            notes += [(i, chord[(i * 3 + bar) % 4], 0.5 * (0.6 + 0.4 * (i % 2)), 1) for i in range(8)]
        for place, tone, level, seconds in notes:
            frequency = 220 * 2 ** ((tone + transposition) / 12)
            pan = 0.5 + 0.35 * math.sin(place + bar)
            start = int((bar * 8 + place) * step * RATE)
            for i, sample in enumerate(pluck(frequency, seconds, level * swell, noise)[: length - start]):
                left[start + i] += sample * (1 - pan)
                right[start + i] += sample * pan
    peak = max(map(abs, left + right))
    frames = array.array("h")
    for pair in zip(left, right):
        frames.extend(round(30000 * math.tanh(3 * sample / peak)) for sample in pair)
    return frames.tobytes()


def write_wav(path, frames):
    with wave.open(str(path), "wb") as file:
        file.setnchannels(2)
        file.setsampwidth(2)
        file.setframerate(RATE)
        file.writeframes(frames)


class Terminal:
    """As much of a terminal as the program uses: lines, and going up to rewrite them."""

    def __init__(self):
        self.lines = [""]
        self.row = 0

    def write(self, text):
        for part in re.findall(r"\x1b\[\d*[A-Za-z]|\r\n|\r|[^\x1b\r]+", text):
            if part == "\r\n":
                self.row += 1
                if self.row == len(self.lines):
                    self.lines.append("")
            elif part.startswith("\x1b") and part.endswith("A"):
                self.row -= int(part[2:-1] or 1)
            elif part == "\x1b[2K":
                self.lines[self.row] = ""
            elif part.startswith("\x1b"):
                sys.exit(f"pictures.py: {part!r} is not supported")
            elif part != "\r":
                self.lines[self.row] += part

    def run(self, command, folder, until=None):
        """Runs a command, and kills it as soon as `until` matches the screen."""
        self.write(f"$ {command}\r\n")
        process, terminal = pty.fork()
        if process == 0:
            fcntl.ioctl(1, termios.TIOCSWINSZ, struct.pack("HHHH", 40, COLUMNS, 0, 0))
            os.chdir(folder)
            os.execvp("bash", ["bash", "-c", f"exec {command}"])
        decoded = b""
        while True:
            try:
                decoded = os.read(terminal, 65536)
            except OSError:
                break
            self.write(decoded.decode())
            if until and re.search(until, "\n".join(self.lines), re.S):
                os.kill(process, 9)
                break
        os.close(terminal)
        os.waitpid(process, 0)


def draw_terminal(lines, path):
    """An SVG of fixed-width text. textLength keeps the columns whatever font the reader has."""
    width, height, margin, bar = 8.4, 18, 16, 34
    columns = max(map(len, lines))
    size = (columns * width + 2 * margin, len(lines) * height + bar + margin)
    svg = [
        f'<svg xmlns="http://www.w3.org/2000/svg" viewBox="0 0 {size[0]:.0f} {size[1]:.0f}" width="{size[0]:.0f}">',
        '<rect width="100%" height="100%" rx="8" fill="#1e2127"/>',
        *(f'<circle cx="{20 + 20 * i}" cy="17" r="6" fill="{fill}"/>' for i, fill in enumerate(["#e06c75", "#e5c07b", "#98c379"])),
        '<g font-family="DejaVu Sans Mono, Menlo, Consolas, monospace" font-size="14" xml:space="preserve">',
    ]
    for row, line in enumerate(lines):
        x, y = margin, bar + (row + 0.7) * height
        is_command = line.startswith("$ ")
        fill = "#98c379" if is_command else "#e06c75" if line.startswith("tonewright: ") else "#c8ccd4"
        if line.strip():
            length = f'textLength="{len(line) * width:.1f}" lengthAdjust="spacingAndGlyphs"'
            svg.append(f'<text x="{x}" y="{y:.1f}" fill="{fill}" {length}>{html.escape(line, quote=False)}</text>')
    svg += ["</g>", "</svg>"]
    path.write_text("\n".join(svg) + "\n")


def main():
    build = pathlib.Path(sys.argv[1] if len(sys.argv) > 1 else ROOT / "build/release").resolve()
    os.environ["PATH"] = f"{build / 'bin'}:{os.environ['PATH']}"
    images = ROOT / "docs/images"
    images.mkdir(exist_ok=True)
    with tempfile.TemporaryDirectory() as folder:
        work = pathlib.Path(folder)
        for name, bars, transposition in [("dawn", 12, 0), ("noon", 16, 5), ("dusk", 8, -3)]:
            write_wav(work / f"{name}.wav", compose(bars, transposition))
        image = images / "waveform.png"
        subprocess.run(["tonewright", "waveform", work / "dawn.wav", "-o", image, "--force"], check=True)

        terminal = Terminal()
        terminal.run("tonewright info *.wav", work)
        terminal.run("tonewright convert dawn.wav -o dawn.flac", work)
        terminal.run('tonewright tag set dawn.flac --title "Before dawn" --artist Strings --track 1/3', work)
        terminal.run("tonewright convert dawn.flac -o dawn.mp3 --quality 0.8", work)
        terminal.run("tonewright tag show dawn.mp3", work)
        terminal.run("tonewright convert dawn.mp3 -o dawn.wav", work)
        # A piece of the file overwritten, as a bad sector leaves it.
        damaged = bytearray((work / "dawn.flac").read_bytes())
        place = len(damaged) // 2
        damaged[place : place + 4096] = bytes(4096)
        (work / "damaged.flac").write_bytes(damaged)
        terminal.run("tonewright convert damaged.flac -o rescued.flac", work)
        terminal.run("tonewright convert damaged.flac -o rescued.flac --salvage", work)
        terminal.run("tonewright convert *.wav --to ogg -j 3", work, until=r"(\n\w+\.wav [^\n]* [3-7]\d %[^\n]*){3}")
        draw_terminal([line for line in terminal.lines if line], images / "terminal.svg")
    print(*sorted(images.iterdir()), sep="\n")


if __name__ == "__main__":
    main()
