#!/usr/bin/env python3
"""Converts a sound file with a progress line: convert.py INPUT OUTPUT

Uses the C interface through ctypes. The libraries are looked for by the system's loader, or in the folder that the
environment variable TONEWRIGHT_LIBDIR names.
"""
import ctypes
import os
import sys
from ctypes import POINTER, Structure, byref, c_char, c_char_p, c_double, c_int32, c_int64, c_size_t, c_void_p

CONTINUE = 1


class MediaInfo(Structure):
    _fields_ = [
        ("size", c_size_t),
        ("sample_rate", c_int32),
        ("channel_count", c_int32),
        ("bytes_per_sample", c_int32),
        ("duration", c_double),
        ("bit_rate", c_int64),
        ("codec", c_char * 64),
        ("plugin", c_char * 64),
    ]


class Failure(Structure):
    _fields_ = [
        ("size", c_size_t),
        ("kind", c_char_p),
        ("title", c_char_p),
        ("message", c_char_p),
        ("file", c_char_p),
    ]


Progress = ctypes.CFUNCTYPE(c_int32, c_double, c_void_p)


def load(name):
    folder = os.environ.get("TONEWRIGHT_LIBDIR")
    return ctypes.CDLL(os.path.join(folder, name) if folder else name)


os.environ.setdefault("TONEWRIGHT_DEBUG_OUTPUT", "0")  # failures are reported below
core, host = load("libtonewright.so.0"), load("libtonewright_host.so.0")
for library, name, result, arguments in [
    (host, "TONEWRIGHT_Host_PathToURI", c_void_p, [c_char_p]),
    (host, "TONEWRIGHT_Host_Free", None, [c_void_p]),
    (host, "TONEWRIGHT_Host_OpenMedia", c_void_p, [c_void_p, POINTER(MediaInfo)]),
    (host, "TONEWRIGHT_Host_DestroyHandle", None, [c_void_p]),
    (host, "TONEWRIGHT_Host_SetEncoderProgress", c_int32, [c_void_p, Progress, c_void_p]),
    (host, "TONEWRIGHT_Host_GetLastFailure", c_int32, [POINTER(Failure)]),
    (core, "TONEWRIGHT_CreateAudioFormatFromURI", c_void_p, [c_void_p] + [c_int32] * 3 + [c_double] + [c_int32] * 3),
    (core, "TONEWRIGHT_CreateAudioEncoder", c_void_p, [c_void_p, c_void_p]),
    (core, "TONEWRIGHT_AudioEncoder_Encode", c_int32, [c_void_p]),
]:
    function = getattr(library, name)
    function.restype, function.argtypes = result, arguments


def require(handle):
    if handle:
        return handle
    failure = Failure(ctypes.sizeof(Failure))
    host.TONEWRIGHT_Host_GetLastFailure(byref(failure))
    raise RuntimeError(os.fsdecode(failure.message))


@Progress
def show(fraction, _user):
    print(f"\r{fraction:4.0%}", end="", file=sys.stderr)
    return CONTINUE


def convert(source_path, target_path):
    handles, texts = [], []

    def keep(handle):
        handles.append(require(handle))
        return handle

    try:
        texts = [host.TONEWRIGHT_Host_PathToURI(os.fsencode(path)) for path in (source_path, target_path)]
        info = MediaInfo(ctypes.sizeof(MediaInfo))
        source = keep(host.TONEWRIGHT_Host_OpenMedia(texts[0], byref(info)))
        target = keep(
            core.TONEWRIGHT_CreateAudioFormatFromURI(
                texts[1], info.sample_rate, info.channel_count, info.bytes_per_sample, 0.0, 0, 0, 0
            )
        )
        encoder = keep(core.TONEWRIGHT_CreateAudioEncoder(source, target))
        host.TONEWRIGHT_Host_SetEncoderProgress(encoder, show, None)
        require(core.TONEWRIGHT_AudioEncoder_Encode(encoder) == 0)
        print(f"\r{info.codec.decode()}, {info.sample_rate} Hz, {info.channel_count} channels, {info.duration:.2f} s")
    finally:
        for handle in reversed(handles):
            host.TONEWRIGHT_Host_DestroyHandle(handle)
        for text in texts:
            host.TONEWRIGHT_Host_Free(text)


def main():
    if len(sys.argv) != 3:
        sys.exit(__doc__.splitlines()[0])
    if core.TONEWRIGHT_InitStartup() != 0:
        sys.exit("The library cannot be started")
    try:
        convert(*sys.argv[1:])
    except RuntimeError as error:
        sys.exit(f"{sys.argv[1]}: {error}")
    finally:
        core.TONEWRIGHT_DeInitAll()


if __name__ == "__main__":
    main()
