"""presets.py LV2_BUNDLE < STATES
Whether every factory preset is the same in all formats: the states of those of CLAP and VST3 (plugin_host --presets)
beside the values and settings in LV2's files. In VST3 one plug-in serves mono and stereo."""

import base64
import collections
import pathlib
import re
import struct
import sys

expected = {}
for file in pathlib.Path(sys.argv[1]).glob("*-presets.ttl"):
    description = file.with_name(file.name.replace("-presets", "")).read_text()
    names = dict(re.findall(r'\n<(\S+)>\n    a .*lv2:Plugin, .*\n    doap:name "(.+)"', description))
    controls = r'InputPort, lv2:ControlPort ;\n.*\n *lv2:symbol "(.*)"'
    symbols = {part.split(">")[0]: re.findall(controls, part)[1:] for part in description.split("\n<")}
    for text in file.read_text().split("\n<")[1:]:
        uri, told = re.search("appliesTo <(.+)>", text)[1], dict(re.findall(r'symbol "(.+)" ; pset:value (\S+)', text))
        values = [float(told.get(symbol, 0)) for symbol in symbols[uri]]  # actions are in no preset
        settings = base64.b64decode(re.search(r'state:state .* "(.+)"\^\^', text)[1])
        preset = names[uri], re.search('label "(.+)"', text)[1]
        expected[preset] = b"DSP1\0" + struct.pack(f"<{len(values)}f", *values) + settings

wrong, found = [], collections.Counter()
for plugin, label, state in (line.split("\t") for line in sys.stdin if "\t" in line):
    found[plugin, label] += 1
    saved = bytes.fromhex(state)
    # VST3's begins with the number of the program.
    if expected.get((plugin, label)) not in (saved, saved[4:]):
        wrong.append(f"{plugin}: {label} is another preset in LV2, or none")
for plugin, label in expected:
    if found[plugin, label] != (1 if plugin.endswith("(mono)") else 2):
        wrong.append(f"{plugin}: CLAP or VST3 has not the preset {label}")
print("\n".join(wrong) or f"{len(expected)} presets")
sys.exit(bool(wrong or not expected))
