#!/usr/bin/env bash
# Installs the Debian packages the build needs, and only those that are missing.
#   tools/install-deps.sh            build, tests and zmtool
#   tools/install-deps.sh bench      ... plus the benchmark peers
#   tools/install-deps.sh fuzz       ... plus clang and libFuzzer
#   tools/install-deps.sh clang|tidy ... plus clang, or clang-tidy and clang-format
set -euo pipefail

# libeigen3-dev: the tests' and benchmarks' linear-algebra oracle, never linked into the library.
# python3-pydicom, python3-numpy: real DICOM pixels and their NumPy oracle for the zmtool raw tests.
packages=(make cmake ninja-build g++ pkg-config libboost-dev libgtest-dev libgmock-dev libeigen3-dev
          python3-numpy python3-pydicom)
for extra in "$@"; do
  case "$extra" in
    bench) packages+=(libbenchmark-dev libspdlog-dev libssl-dev) ;;
    fuzz) packages+=(clang libclang-rt-dev) ;;
    clang) packages+=(clang) ;;
    tidy) packages+=(clang-tidy clang-format) ;;
    *) echo "install-deps: unknown group '$extra'" >&2; exit 2 ;;
  esac
done

missing=()
for p in "${packages[@]}"; do
  dpkg-query -W -f='${Status}' "$p" 2>/dev/null | grep -q "install ok installed" || missing+=("$p")
done
[ ${#missing[@]} -eq 0 ] && exit 0

echo "install-deps: installing ${missing[*]}"
sudo=""
if [ "$(id -u)" -ne 0 ]; then
  command -v sudo >/dev/null || { echo "install-deps: need root or sudo to install ${missing[*]}" >&2; exit 1; }
  sudo="sudo"
fi
export DEBIAN_FRONTEND=noninteractive
$sudo apt-get update -qq
$sudo apt-get install -y -qq --no-install-recommends "${missing[@]}"
