#!/usr/bin/env python3
"""Take a picture of the reference page in a headless Chromium.

    tools/reference/picture.py PAGE PICTURE [--at HASH] [--size WIDTHxHEIGHT] [--dark]
"""

import argparse
import pathlib

from browser import Browser


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("page", type=pathlib.Path)
    parser.add_argument("picture", type=pathlib.Path)
    parser.add_argument("--at", default="ADDSNX16T&q=adds", help="what stands behind # in the address")
    parser.add_argument("--size", default="1280x860")
    parser.add_argument("--dark", action="store_true")
    arguments = parser.parse_args()
    browser = Browser()
    try:
        browser.resize(*map(int, arguments.size.split("x")))
        browser.prefer("dark" if arguments.dark else "light")
        browser.open(f"{arguments.page.resolve().as_uri()}#{arguments.at}")
        arguments.picture.write_bytes(browser.picture())
    finally:
        browser.close()


if __name__ == "__main__":
    main()
