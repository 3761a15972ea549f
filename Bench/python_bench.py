"""What a call from Python costs beside the same call in C++, both timed in turn in one process:

    cmake --build build/python --target dsp_call_peer
    PYTHONPATH=build/python python3 Bench/python_bench.py build/python/bin/libdsp_call_peer.so
"""

import ctypes
import hashlib
import sys
import threading
import time

import numpy as np

import dspdll as dsp

RATE = 48000
ROUNDS = 40
REPEATS = 500


def processor_seconds(call):
    """Of this thread alone, so that other programs on the machine count for little."""
    start = time.thread_time()
    call()
    return time.thread_time() - start


def fastest(time_of, *calls):
    """The fastest of many rounds of each, taken in turn."""
    rounds = [[time_of(call) for call in calls] for _ in range(ROUNDS)]
    return [min(column) for column in zip(*rounds)]


def compare(name, peer, recording, block):
    effect = getattr(dsp, name)()
    handle = peer.peer_open(effect._table.kind.encode())
    whole = fastest(processor_seconds, lambda: peer.peer_call(handle, recording.ctypes.data, len(recording), True, 1),
                    lambda: effect(recording, RATE))
    stream = effect.stream(RATE, 2)

    def stream_blocks():
        for _ in range(REPEATS):
            stream(block)

    short = fastest(processor_seconds, lambda: peer.peer_call(handle, block.ctypes.data, len(block), False, REPEATS),
                    stream_blocks)
    short = [seconds / REPEATS for seconds in short]
    print(f"{name:12} {whole[0] * 1e3:18.2f} ms {whole[1] * 1e3:6.2f} ms  {whole[1] / whole[0]:5.3f} |"
          f" {short[0] * 1e6:12.2f} us {short[1] * 1e6:5.2f} us {(short[1] - short[0]) * 1e6:5.2f} us")


def in_threads(count, work, *arguments):
    """Wall time of so many threads that do the same."""
    threads = [threading.Thread(target=work, args=arguments) for _ in range(count)]
    start = time.perf_counter()
    for thread in threads:
        thread.start()
    for thread in threads:
        thread.join()
    return time.perf_counter() - start


def main():
    peer = ctypes.CDLL(sys.argv[1])
    peer.peer_open.restype = ctypes.c_void_p
    peer.peer_call.argtypes = [ctypes.c_void_p, ctypes.c_void_p, ctypes.c_int, ctypes.c_bool, ctypes.c_int]
    recording = np.random.default_rng(1).standard_normal((10 * RATE, 2)).astype(np.float32) * 0.1
    print("effect        10 s of stereo: C++    Python   ratio | 64 frames: C++   Python  more")
    for name in dsp.effects.__all__:
        compare(name, peer, recording, recording[:64].copy())
    chain = dsp.Chain([dsp.Compressor(), dsp.Reverb()])
    print("\nTwo threads, beside the time of one; hashing shows what the machine gives to two threads now")
    for what, work, arguments in (("files", chain, (recording, RATE)), ("hashing", hashlib.sha256, (bytes(20_000_000),))):
        one, two = fastest(lambda count: in_threads(count, work, *arguments), 1, 2)
        print(f"{what:8} {one * 1e3:6.1f} ms {two * 1e3:6.1f} ms: {two / one:.2f} times")


main()
