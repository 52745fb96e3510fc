"""Short jobs, where most of the time is the start of the program, beside programs that do the same."""

import os
import subprocess
import time

RUNS = 60


def measure(command):
    """Processor and wall time in milliseconds, with the processes that the program waits for."""
    start = time.perf_counter()
    process = subprocess.Popen(command, stdin=subprocess.DEVNULL, stdout=subprocess.DEVNULL, stderr=subprocess.DEVNULL)
    _, status, usage = os.wait4(process.pid, 0)
    wall = time.perf_counter() - start
    process.returncode = os.waitstatus_to_exitcode(status)
    if process.returncode != 0:
        raise SystemExit(f"failed ({process.returncode}): {' '.join(map(str, command))}")
    return (usage.ru_utime + usage.ru_stime) * 1000, wall * 1000


def bench_startup(host, work):
    """Runs each job and its peer alternately; the minimum of each figure counts."""
    wav, flac, copy = (work / name for name in ("short.wav", "short.flac", "copy.flac"))
    subprocess.run(["sox", "-V1", "-n", "-r", "44100", "-c", "2", "-b", "16", wav, "synth", "1", "pinknoise"], check=True)
    for target in (flac, copy):
        subprocess.run(["flac", "-s", "-f", wav, "-o", target], check=True)
    rows = [
        ("info", lambda n: [host, "info", flac], "soxi", lambda n: ["soxi", flac]),
        ("tag show", lambda n: [host, "tag", "show", flac], "soxi", lambda n: ["soxi", flac]),
        (
            "tag set", lambda n: [host, "tag", "set", flac, "--title", f"title {n:06}"],
            "metaflac", lambda n: ["metaflac", "--remove-tag=TITLE", f"--set-tag=TITLE=title {n:06}", copy],
        ),
    ]
    print(f"\n{'start-up':12} {'CPU ms':>8} {'wall ms':>8}  {'peer':10} {'CPU ms':>8} {'wall ms':>8}")
    for title, ours, peer, theirs in rows:
        pairs = [(measure(ours(n)), measure(theirs(n))) for n in range(RUNS)]
        mine, other = (tuple(map(min, zip(*side))) for side in zip(*pairs))
        print(f"{title:12} {mine[0]:8.2f} {mine[1]:8.2f}  {peer:10} {other[0]:8.2f} {other[1]:8.2f}", flush=True)
    for leftover in (wav, flac, copy):
        leftover.unlink()
