#!/usr/bin/python3
"""Fails for what the reference lists without a word about it: doc-texts.py XML, Doxygen's folder of that name.

A value of an enumeration may be left to the text of the enumeration, and an operation to the text of the one that it
overrides. What every class has needs none: construction without arguments, destruction, comparison."""

import pathlib
import re
import sys
import xml.etree.ElementTree


def has_text(element):
    texts = (element.find(name) for name in ("briefdescription", "detaileddescription"))
    return any("".join(text.itertext()).strip() for text in texts if text is not None)


def needs_text(member, owner):
    name, arguments = member.findtext("name"), member.findtext("argsstring") or ""
    if member.get("prot") == "private" or member.get("kind") == "friend" or member.find("reimplements") is not None:
        return False
    return not (name.startswith("~") or name == "operator==" or name == owner and arguments.startswith("()"))


def is_silent(member):
    return not has_text(member) and not (member.get("kind") == "enum" and all(map(has_text, member.iter("enumvalue"))))


def misplaced(folder):
    """What stands at the wrong place in the C interface: its parts belong into one group, with a text of its own."""
    groups = {file.stem: xml.etree.ElementTree.parse(file).find("compounddef")
              for file in pathlib.Path(folder).glob("group__C*.xml")}  # fmt: skip
    whole = groups.pop("group__C")
    lost = set(groups) - {part.get("refid") for part in whole.iter("innergroup")}
    return {f"{name} is no part of group__C" for name in lost} | (set() if has_text(whole) else {"group__C has no text"})


def main(folder):
    count, silent = 0, misplaced(folder)
    for file in pathlib.Path(folder).glob("*.xml"):
        for compound in xml.etree.ElementTree.parse(file).iter("compounddef"):
            if compound.get("prot") == "private":
                continue
            name = compound.findtext("compoundname")
            location = compound.find("location")
            if compound.get("kind") in ("struct", "class") and location is not None and location.get("bodyfile"):
                count += 1
                if not has_text(compound):
                    silent.add(f"{location.get('file')}: {name}")
            for member in compound.iter("memberdef"):
                count += 1
                if needs_text(member, re.sub(r"<.*", "", name).split("::")[-1].strip()) and is_silent(member):
                    silent.add(f"{member.find('location').get('file')}: {name} {member.findtext('name')}")
    print(*sorted(silent), f"{count} texts of the reference, {len(silent)} missing", sep="\n")
    return 1 if silent or count == 0 else 0


if __name__ == "__main__":
    sys.exit(main(*sys.argv[1:]))
