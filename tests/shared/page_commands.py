# SPDX-License-Identifier: MIT
"""The commands of the pages in docs/: what a page tells its reader to type, and what it says will be seen.

A block that begins with ```sh holds commands only. One that begins with ```console holds commands behind "$ ", their
further lines behind "> ", and below each what it prints; a line "..." there stands for any number of lines.
"""
import collections
import re

Block = collections.namedtuple("Block", "heading language text")
Command = collections.namedtuple("Command", "heading text shown")  # shown: None for a command of a block sh.


def blocks(page):
    """Every fenced block of the page, which is a path, in its order. The heading is the one of the second level."""
    heading, found = "", []
    pattern = re.compile(r"^## (?P<heading>[^\n]+)$|^```(?P<language>\w*)\n(?P<text>.*?)^```$",
                         re.MULTILINE | re.DOTALL)
    for match in pattern.finditer(page.read_text()):
        if match["heading"]:
            heading = match["heading"]
        else:
            found.append(Block(heading, match["language"], match["text"]))
    return found


def commands(page):
    """What the page tells its reader to type, in its order."""
    found = []
    for block in blocks(page):
        if block.language == "sh":
            found.append(Command(block.heading, block.text, None))
        elif block.language == "console":
            for part in re.split(r"^\$ ", block.text, flags=re.MULTILINE)[1:]:
                lines = part.splitlines()
                more = next((at for at, line in enumerate(lines) if at and not line.startswith("> ")), len(lines))
                found.append(Command(block.heading, "\n".join([lines[0], *(line[2:] for line in lines[1:more])]),
                                     "\n".join(lines[more:])))
    return found
