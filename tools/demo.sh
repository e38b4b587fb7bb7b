#!/usr/bin/env bash
# Runs the examples of a build on the data that is shipped; sounds and pictures go to BUILD/demo-output.
#
#   tools/demo.sh BUILD [WRAPPER...]     WRAPPER: a command to run each of them under, such as valgrind
set -euo pipefail

[[ $# -ge 1 ]] || { echo "usage: tools/demo.sh BUILD [WRAPPER...]" >&2; exit 2; }
examples=$(realpath "$1/examples")
mkdir -p "$1/demo-output"
cd "$1/demo-output"
shift

for example in fir mixer biquad convolve threshold histogram ports; do
  printf '\n'
  "$@" "$examples/$example"
done
printf '\nSounds and pictures are in %s\n' "$PWD"
