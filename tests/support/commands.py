"""Commands that tests run, and the width of programs."""

import os
import subprocess


def run(*command, **options):
    """With standard output and errors in one text."""
    return subprocess.run(command, stdout=subprocess.PIPE, stderr=subprocess.STDOUT, text=True, check=False, **options)


def run_apart(*command, **environment):
    """With standard output and errors apart, and these variables in its environment."""
    return subprocess.run(command, capture_output=True, text=True, check=False, env=dict(os.environ, **environment))


def output(*command, **options):
    """What a command prints that has to succeed."""
    result = run(*command, **options)
    if result.returncode != 0:
        raise AssertionError(" ".join(command) + "\n" + result.stdout)
    return result.stdout


def bits_of(program):
    """32 or 64, by the class of the ELF file."""
    with open(program, "rb") as file:
        return 32 * file.read(5)[4]
