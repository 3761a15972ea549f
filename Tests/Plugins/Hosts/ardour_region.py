#!/usr/bin/env python3
"""ardour_region.py SESSION RECORDING: puts the whole recording on the track of a session that ardour.lua made, and
marks it as the range to export."""
import pathlib
import re
import shutil
import sys

import soundfile

folder = pathlib.Path(sys.argv[1])
recording = soundfile.info(sys.argv[2])
length = recording.frames * (282240000 // recording.samplerate)  # Ardour's ticks
channels = range(recording.channels)
shutil.copy(sys.argv[2], next((folder / "interchange").iterdir()) / "audiofiles" / "in.wav")


def region(number, whole):
    sources = " ".join(f'source-{c}="{9001 + c}" master-source-{c}="{9001 + c}"' for c in channels)
    return (f'<Region name="in" id="{number}" type="audio" whole-file="{whole}" start="a0" length="a{length}@a0" '
            f'opaque="1" layering-index="0" default-fade-in="0" default-fade-out="0" fade-in-active="0" '
            f'fade-out-active="0" channels="{len(channels)}" {sources}/>')


sources = "".join(f'<Source name="in.wav" type="audio" flags="" id="{9001 + c}" channel="{c}" origin="in.wav" gain="1"/>'
                  for c in channels)
session = folder / "t.ardour"
text = session.read_text()
for old, new in [("<Sources/>", f"<Sources>{sources}</Sources>"),
                 ("<Regions/>", f"<Regions>{region(9003, 1)}</Regions>"),
                 ("<Locations/>", '<Locations><Location id="9005" name="session" start="a0" '
                                  f'end="a{length}" flags="IsSessionRange" locked="0" cue="0"/></Locations>')]:
    if old not in text:
        sys.exit(f"{session} has no {old}")
    text = text.replace(old, new)
text, playlists = re.subn(r'(<Playlist [^>]*name="T"[^>]*?)/>', rf"\1>{region(9004, 0)}</Playlist>", text)
if playlists != 1:
    sys.exit(f"{session} has no track")
session.write_text(text)
