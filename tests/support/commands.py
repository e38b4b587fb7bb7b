"""Commands that tests run, their standard output and errors in one text."""

import subprocess


def run(*command, **options):
    return subprocess.run(command, stdout=subprocess.PIPE, stderr=subprocess.STDOUT, text=True, check=False, **options)


def output(*command, **options):
    """What a command prints that has to succeed."""
    result = run(*command, **options)
    if result.returncode != 0:
        raise AssertionError(" ".join(command) + "\n" + result.stdout)
    return result.stdout
