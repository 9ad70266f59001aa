"""Plays silence and in it one second of a tone, by PulseAudio: tone.py SECONDS_OF_SILENCE. Prints when the tone is to be
heard, on the system's monotonic clock, as PulseAudio says."""

import ctypes
import math
import struct
import sys
import time

RATE = 48000
BLOCK = RATE // 100


class Sample(ctypes.Structure):
    _fields_ = [("format", ctypes.c_int), ("rate", ctypes.c_uint32), ("channels", ctypes.c_uint8)]


class Buffer(ctypes.Structure):
    _fields_ = [(name, ctypes.c_uint32) for name in ("maxlength", "tlength", "prebuf", "minreq", "fragsize")]


def main():
    pulse = ctypes.CDLL("libpulse-simple.so.0")
    pulse.pa_simple_new.restype = ctypes.c_void_p
    pulse.pa_simple_get_latency.restype = ctypes.c_uint64
    any_size = 2**32 - 1
    float32 = 5
    error = ctypes.c_int()
    buffer = Buffer(any_size, 4 * BLOCK * 25, any_size, any_size, any_size)  # 250 ms
    stream = ctypes.c_void_p(pulse.pa_simple_new(None, b"tone", 1, None, b"tone", ctypes.byref(Sample(float32, RATE, 1)),
                                                 None, ctypes.byref(buffer), ctypes.byref(error)))
    if not stream:
        sys.exit(f"PulseAudio does not answer: {error.value}")
    silence = bytes(4 * BLOCK)
    tone = struct.pack(f"<{BLOCK}f", *[0.5 * math.sin(2 * math.pi * 1000 * n / RATE) for n in range(BLOCK)])
    blocks = int(100 * float(sys.argv[1]))
    for number in range(blocks + 200):
        if number == blocks:
            heard = time.monotonic() + pulse.pa_simple_get_latency(stream, ctypes.byref(error)) / 1e6
            print(heard, flush=True)
        pulse.pa_simple_write(stream, tone if blocks <= number < blocks + 100 else silence, ctypes.c_size_t(4 * BLOCK),
                              ctypes.byref(error))


if __name__ == "__main__":
    main()
