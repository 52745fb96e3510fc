"""Processor time of playback, on a private sound server with a device that discards the sound."""

import contextlib
import os
import pathlib
import socket
import subprocess
import tempfile
import time

SECONDS = 30


@contextlib.contextmanager
def sound_server():
    """Sets the environment of child processes so that they see one device."""
    with tempfile.TemporaryDirectory() as name:
        folder = pathlib.Path(name)
        address = str(folder / "s")
        (folder / "script.pa").write_text(
            ".fail\nload-module module-null-sink sink_name=out rate=44100 channels=2 format=s16le norewinds=1\n"
            f"load-module module-native-protocol-unix socket={address} auth-anonymous=1 auth-cookie-enabled=0\n"
        )
        (folder / "asound.conf").write_text(
            f'pcm.default {{ type pulse server "unix:{address}" }}\nctl.default {{ type pulse server "unix:{address}" }}\n'
        )
        home = {"PATH": "/usr/bin:/bin", "HOME": name, "XDG_RUNTIME_DIR": name, "PULSE_RUNTIME_PATH": name, "PULSE_STATE_PATH": name}
        daemon = subprocess.Popen(
            ["pulseaudio", "-n", "-F", folder / "script.pa", "--daemonize=no", "--use-pid-file=no", "--exit-idle-time=-1",
             "--disable-shm=yes", "--high-priority=no", "--realtime=no"],
            env=home, stdout=subprocess.DEVNULL, stderr=subprocess.DEVNULL,
        )
        try:
            with socket.socket(socket.AF_UNIX) as client:
                while client.connect_ex(address) != 0:
                    if daemon.poll() is not None:
                        raise RuntimeError("the sound server does not start")
                    time.sleep(0.01)
            os.environ.update(
                ALSA_CONFIG_PATH=str(folder / "asound.conf"), PULSE_SERVER=f"unix:{address}", PULSE_COOKIE=str(folder / "cookie"),
                PULSE_RUNTIME_PATH=name, JACK_NO_START_SERVER="1",
            )
            yield
        finally:
            daemon.terminate()
            daemon.wait()


def bench_playing(host, work, wav, run):
    part, flac = work / "playing.wav", work / "playing.flac"
    subprocess.run(["sox", wav, part, "trim", "0", str(SECONDS)], check=True)
    subprocess.run(["flac", "-s", "-f", part, "-o", flac], check=True)
    print(f"\n{f'playing {SECONDS} seconds':40} {'% of a core':>12} {'late, s':>9} {'MiB':>6}")
    with sound_server():
        for title, command in (
            ("tonewright, WAV", [host, "play", "--quiet", part]),
            ("tonewright, FLAC", [host, "play", "--quiet", flac]),
            ("aplay, WAV", ["aplay", "-q", "-D", "default", part]),
        ):
            cpu, wall, peak = run(command)
            print(f"{title:40} {cpu / SECONDS * 100:12.2f} {wall - SECONDS:9.2f} {peak / 1024:6.1f}", flush=True)
    part.unlink()
    flac.unlink()
