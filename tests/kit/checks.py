"""What the checks that drive a built program have in common: their options,
and the program's command.

A check is run as

    NAME_check.py --tool "LAUNCHER... PATH/PROGRAM" --bin-dir DIR
                  [--quick] [--seed N] [--only]

and ends with 0 if all is alike, 1 for a difference, SKIPPED if the program is
not there.
"""

import argparse
import os
import shlex

SKIPPED = 77


def parse_arguments(description):
    parser = argparse.ArgumentParser(description=description)
    parser.add_argument("--tool", help="launcher and program, shell-like")
    parser.add_argument("--bin-dir", help="where the built programs lie")
    parser.add_argument("--quick", action="store_true")
    parser.add_argument("--seed", type=int, default=1)
    parser.add_argument("--only", action="store_true")
    return parser.parse_args()


def resolved_tool(arguments, program):
    """The command as a list; words that name files made absolute, since the
    program runs in other folders. None, with a word about it, if it is not
    there."""
    default = os.path.join(arguments.bin_dir or ".", program)
    words = shlex.split(arguments.tool or shlex.quote(default))
    if not words or not os.path.isfile(words[-1]):
        print("skipped: no program in %r" % (arguments.tool or "--bin-dir"))
        return None
    return [os.path.abspath(word) if os.path.isfile(word) else word
            for word in words]
