"""What the guides tell the administrator to type, so that a test types exactly that."""

import os
import re

GUIDES = os.path.join(os.path.dirname(__file__), "..", "..", "docs")


def blocks(guide, heading, language=""):
    """The blocks of code of a language under a heading of a guide, down to the next heading."""
    with open(os.path.join(GUIDES, guide)) as file:
        lines = file.read().split("\n")
    found, block, here = [], None, False
    for line in lines:
        if line.strip().startswith("```"):
            if block is None:
                block = (line.strip()[3:], [])
            else:
                if here and block[0] == language:
                    found.append("\n".join(block[1]))
                block = None
        elif block is not None:
            block[1].append(line)
        elif re.match("#+ ", line):
            here = line.lstrip("#").strip() == heading
    if not found:
        raise LookupError(f"{guide} has no block of code under '{heading}'")
    return found


def root_commands(guide, heading):
    """The command lines under a heading that are for root, which begin with `#`; one can go on in indented lines."""
    commands = []
    for block in blocks(guide, heading):
        goes_on = False
        for line in block.split("\n"):
            if line.lstrip().startswith("# "):
                commands.append(line.lstrip()[2:])
            elif goes_on:
                commands[-1] += "\n" + line
            goes_on = bool(commands) and commands[-1].endswith("\\")
    if not commands:
        raise LookupError(f"{guide} has no commands for root under '{heading}'")
    return commands
