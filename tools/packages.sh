#!/usr/bin/env bash
# Installs the Debian packages that are missing for the named purposes, as root or through sudo; where
# neither works, prints the commands that do it and fails. On a system that is not Debian it names them and goes on.
#
#   tools/packages.sh PURPOSE...     build, demo, test, test-64, picture, python, check
set -euo pipefail

declare -A packages=(
  [build]="g++-multilib cmake ninja-build python3"
  [demo]="librsvg2-bin"
  [test]="clang gdb pkg-config chromium chromium-driver libgtest-dev:i386 libbenchmark-dev:i386 libmpfr-dev:i386"
  [test-64]="clang gdb pkg-config chromium chromium-driver libgtest-dev:amd64 libbenchmark-dev:amd64 libmpfr-dev:amd64
    python3-numpy python3-dev python3-pip python3-setuptools python3-wheel"
  [python]="python3-numpy python3-dev python3-pip python3-setuptools python3-wheel python3-matplotlib"
  [picture]="chromium chromium-driver"
  [check]="clang-format valgrind libc6-dbg:i386"
)

wanted=()
for purpose in "$@"; do
  [[ -v packages[$purpose] ]] || { echo "packages.sh: unknown purpose '$purpose'" >&2; exit 2; }
  read -ra names <<<"${packages[$purpose]}"
  wanted+=("${names[@]}")
done

if ! { command -v dpkg-query && command -v apt-get; } >/dev/null; then
  echo "This is not a Debian system. What is needed here, by Debian's names: ${wanted[*]}" >&2
  exit 0
fi

installed() {
  [[ $(dpkg-query -W -f '${db:Status-Status}' "$1" 2>/dev/null) == installed ]]
}

missing=()
for package in "${wanted[@]}"; do
  installed "$package" || missing+=("$package")
done
[[ ${#missing[@]} -gt 0 ]] || exit 0

commands=()
[[ ${missing[*]} != *:i386* ]] || commands+=("dpkg --add-architecture i386")
commands+=("apt-get update" "apt-get install -y --no-install-recommends ${missing[*]}")

as_root=()
if [[ $(id -u) -ne 0 ]]; then
  if command -v sudo >/dev/null && { sudo -n true 2>/dev/null || [[ -t 0 ]]; }; then
    as_root=(sudo)
  else
    echo "These packages are missing: ${missing[*]}. As root, run:" >&2
    printf '  %s\n' "${commands[@]}" >&2
    exit 1
  fi
fi

echo "Installing ${missing[*]}"
for command in "${commands[@]}"; do
  read -ra words <<<"$command"
  # A list that could not be updated matters only if the packages cannot be installed then.
  "${as_root[@]}" env DEBIAN_FRONTEND=noninteractive "${words[@]}" >/dev/null ||
    [[ $command == "apt-get update" ]] || { echo "failed: $command" >&2; exit 1; }
done
