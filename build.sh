#!/usr/bin/env bash
# Entry point for a fresh machine: installs the missing Debian packages (make and the compilers
# included), then runs the Makefile target given (default: build and run `zmtool demo`).
#   ./build.sh          build, run zmtool demo
#   ./build.sh test     build, run the whole test suite
#   ./build.sh asan|tsan|bench|fuzz|install ...   see the Makefile
set -euo pipefail
cd "$(dirname "$0")"
tools/install-deps.sh
exec make "${@:-demo}"
