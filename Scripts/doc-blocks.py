#!/usr/bin/python3
"""Builds and runs the blocks of code in Markdown pages, so that none of them goes stale.

    doc-blocks.py INSTALLED RECORDINGS [--python] PAGE...

INSTALLED is a folder with headers and libraries, RECORDINGS one whose files the blocks find beside them.
The blocks of a page run in order in one folder, which begins with the recordings. By the word after the fence:
sh is run, c and cpp are compiled, linked and run, json is parsed, python is run with --python (nothing else is then)
and at least compiled without; text and blocks without a word are no code. A block that cannot run says why:
```sh not-run: needs a cluster
Pictures that blocks of a page made, and that the page shows, are put beside the page.
"""

import json
import os
import pathlib
import re
import shutil
import signal
import subprocess
import sys
import tempfile

SECONDS = 100
DIRECTIVE = re.compile(r"^```\{.*?^```$", re.M | re.S)
FENCE = re.compile(r"^```(\w*)(?: not-run: ([^\n]+))?\n(.*?)^```$", re.M | re.S)
ODD_FENCE = re.compile(r"^```.*$", re.M)
# What is written twice is meant to be; what a terminal would show is not looked at.
SHELL = """set -euo pipefail
dsphost() { if [ "$1" = effects ]; then command dsphost "$@"; else command dsphost "$@" -y -q; fi; }
"""


def run(command, folder):
    with subprocess.Popen(command, cwd=folder, text=True, stdin=subprocess.DEVNULL, stdout=subprocess.PIPE,
                          stderr=subprocess.STDOUT, start_new_session=True) as done:  # fmt: skip
        try:
            output = done.communicate(timeout=SECONDS)[0]
        except subprocess.TimeoutExpired:
            os.killpg(done.pid, signal.SIGKILL)
            raise RuntimeError(f"not done after {SECONDS} s") from None
    if done.returncode != 0:
        raise RuntimeError(output.strip() or f"exit status {done.returncode}")


def compile_and_run(language, code, folder, installed):
    (folder / f"block.{language}").write_text(code)
    compiler = ["c++", "-std=c++20"] if language == "cpp" else ["cc", "-std=c11"]
    cairo = subprocess.run(["pkg-config", "--cflags", "--libs", "cairo"], text=True, stdout=subprocess.PIPE, check=True)
    run(
        [*compiler, "-Wall", "-Wextra", "-Werror", "-I", installed / "include/DSPDll", f"block.{language}", "-o", "block",
         f"-L{installed}/lib", "-lDSPDrawing", "-lDSPDll", f"-Wl,-rpath,{installed}/lib", *cairo.stdout.split()],
        folder,
    )  # fmt: skip
    run(["./block"], folder)


def try_block(language, code, folder, installed, with_python):
    if language == "python" and not with_python:
        compile(code, "block", "exec")
    elif with_python != (language == "python") or language in ("", "text"):
        pass
    elif language == "sh":
        run(["bash", "-c", SHELL + code], folder)
    elif language == "python":
        run([sys.executable, "-c", code], folder)
    elif language == "json":
        json.loads(code)
    elif language in ("c", "cpp"):
        compile_and_run(language, code, folder, installed)
    else:
        raise RuntimeError(f'nobody knows how to run "{language}"')


def try_page(page, installed, recordings, with_python):
    """The number of blocks tried and left out, and what failed."""
    text = DIRECTIVE.sub(lambda found: "\n" * found[0].count("\n"), page.read_text())
    tried, left_out, failures = 0, 0, []
    if len(ODD_FENCE.findall(text)) != 2 * len(FENCE.findall(text)):
        failures.append(f"{page}: a fence is neither \"```word\" nor \"```word not-run: why\"")
    with tempfile.TemporaryDirectory() as name:
        folder = pathlib.Path(name)
        for recording in recordings.iterdir():
            (folder / recording.name).symlink_to(recording)
        for block in FENCE.finditer(text):
            language, reason, code = block.groups()
            if reason:
                left_out += 1
                continue
            tried += language not in ("", "text") and with_python == (language == "python")
            try:
                try_block(language, code, folder, installed, with_python)
            except (RuntimeError, ValueError, SyntaxError) as error:
                line = text[: block.start()].count("\n") + 1
                failures.append(f"{page}:{line}: {error}")
        for picture in re.findall(r"!\[[^\]]*\]\(([^/)]+)\)", text):
            if (folder / picture).exists():
                shutil.copy(folder / picture, page.parent)
    return tried, left_out, failures


def main(installed, recordings, *pages):
    installed, recordings = pathlib.Path(installed).resolve(), pathlib.Path(recordings).resolve()
    with_python = "--python" in pages
    tried, left_out, failures = 0, 0, []
    for page in pages:
        if page == "--python":
            continue
        more = try_page(pathlib.Path(page), installed, recordings, with_python)
        tried, left_out, failures = tried + more[0], left_out + more[1], failures + more[2]
    print(*failures, f"{tried} blocks of code tried, {left_out} say why they are not", sep="\n")
    return 1 if failures or tried == 0 else 0


if __name__ == "__main__":
    sys.exit(main(*sys.argv[1:]))
