#!/usr/bin/env bash
# Installs the packages of Debian or Ubuntu that are missing for the named purposes, as root or through sudo; where
# neither works, prints the commands that do it and fails. For Fedora and Arch it prints the command, by their names of
# the packages, and goes on; so it does on other systems, by Debian's names.
#
#   tools/packages.sh PURPOSE...     build, install, release, demo, test, test-64, picture, python, check
#   tools/packages.sh --for debian|ubuntu|fedora|arch PURPOSE...     only print the command for that system
set -euo pipefail

# By Debian's names.
declare -A packages=(
  [build]="make g++-multilib cmake ninja-build python3"
  [install]="help2man"
  [release]="git clang gdb pkg-config"
  [demo]="librsvg2-bin"
  [test]="clang libclang-rt-dev llvm valgrind gdb pkg-config help2man git chromium chromium-driver libc6-dbg:i386 libgtest-dev:i386 libbenchmark-dev:i386 libmpfr-dev:i386"
  [test-64]="clang libclang-rt-dev llvm valgrind gdb pkg-config help2man git chromium chromium-driver libgtest-dev:amd64 libbenchmark-dev:amd64 libmpfr-dev:amd64 python3-numpy python3-dev python3-pip python3-setuptools python3-wheel"
  [python]="python3-numpy python3-dev python3-pip python3-setuptools python3-wheel python3-matplotlib"
  [picture]="chromium chromium-driver"
  [check]="clang-format valgrind libc6-dbg:i386"
)

# The names of others, where they differ. Those for 32 bits are Fedora's of i686 and Arch's of multilib; what begins with
# aur: is not among Arch's own packages.
declare -A debian=()
declare -A ubuntu=([chromium]="chromium-browser" [chromium-driver]="chromium-chromedriver")
declare -A fedora=(
  [g++-multilib]="gcc-c++ glibc-devel.i686 libstdc++-devel.i686 libgcc.i686"
  [librsvg2-bin]="librsvg2-tools" [pkg-config]="pkgconf-pkg-config" [chromium-driver]="chromedriver"
  [libgtest-dev:i386]="gtest-devel.i686" [libbenchmark-dev:i386]="google-benchmark-devel.i686"
  [libmpfr-dev:i386]="mpfr-devel.i686 gmp-devel.i686" [libgtest-dev:amd64]="gtest-devel"
  [libbenchmark-dev:amd64]="google-benchmark-devel" [libmpfr-dev:amd64]="mpfr-devel gmp-devel"
  [clang-format]="clang-tools-extra" [libc6-dbg:i386]="glibc-debuginfo.i686" [libclang-rt-dev]="compiler-rt"
  [python3-dev]="python3-devel"
)
declare -A arch=(
  [g++-multilib]="gcc lib32-gcc-libs lib32-glibc" [ninja-build]="ninja" [python3]="python"
  [librsvg2-bin]="librsvg" [pkg-config]="pkgconf" [chromium-driver]="chromium" [clang-format]="clang"
  [libgtest-dev:i386]="aur:lib32-gtest" [libbenchmark-dev:i386]="aur:lib32-benchmark" [libmpfr-dev:i386]="aur:lib32-mpfr lib32-gmp"
  [libgtest-dev:amd64]="gtest" [libbenchmark-dev:amd64]="benchmark" [libmpfr-dev:amd64]="mpfr gmp"
  [libc6-dbg:i386]="debuginfod" [libclang-rt-dev]="compiler-rt" [python3-numpy]="python-numpy"
  [python3-dev]="python" [python3-pip]="python-pip" [python3-setuptools]="python-setuptools" [python3-wheel]="python-wheel"
  [python3-matplotlib]="python-matplotlib"
)

system=
if [[ ${1:-} == --for ]]; then
  system=$2
  shift 2
fi

wanted=()
for purpose in "$@"; do
  [[ -v packages[$purpose] ]] || { echo "packages.sh: unknown purpose '$purpose'" >&2; exit 2; }
  read -ra names <<<"${packages[$purpose]}"
  wanted+=("${names[@]}")
done

# The names of the wanted packages in the table that is named, each once.
translated() {
  local -n table=$1
  for package in "${wanted[@]}"; do
    tr ' ' '\n' <<<"${table[$package]:-$package}"
  done | sort -u | paste -sd ' '
}

print_for() {
  case $1 in
    debian | ubuntu) echo "apt-get install $(translated "$1")" ;;
    fedora) echo "dnf install $(translated fedora)" ;;
    arch) echo "pacman -S --needed $(translated arch)" ;;
    *) echo "packages.sh: unknown system '$1'; known are debian, ubuntu, fedora and arch" >&2; return 2 ;;
  esac
}

if [[ -n $system ]]; then
  print_for "$system"
  exit
fi
system=debian
! grep -qs '^ID=ubuntu' /etc/os-release || system=ubuntu
if ! { command -v dpkg-query && command -v apt-get; } >/dev/null; then
  ! command -v dnf >/dev/null || system=fedora
  ! command -v pacman >/dev/null || system=arch
  echo "Packages are not installed here. What is needed, if it is missing: $(print_for "$system")" >&2
  exit 0
fi

installed() {
  [[ $(dpkg-query -W -f '${db:Status-Status}' "$1" 2>/dev/null) == installed ]]
}

missing=()
for package in $(translated "$system"); do
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
