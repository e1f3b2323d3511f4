# Thin wrapper over the CMake presets; see README.md.
#   make          install what is missing, build, run `zmtool demo`
#   make test     install what is missing, build, run the whole test suite
#   make asan     the same tests under AddressSanitizer + UndefinedBehaviorSanitizer
#   make tsan     the same tests under ThreadSanitizer
#   make clang    the tests built with Clang (warnings as errors, lock analysis, no global ctors)
#   make tidy     clang-tidy over the library (any finding fails)
#   make aarch64  cross build for 64-bit ARM (warnings as errors), portable suites under qemu-user
#   make bench    release build, run the benchmarks, write docs/benchmarks.md
#   make fuzz     clang build, run every fuzz target for FUZZ_SECONDS (default 60) each
#   make install  install into PREFIX (default /usr/local)
#   make format   clang-format every source file
SHELL := /bin/bash
FUZZ_SECONDS ?= 60
PREFIX ?= /usr/local

.PHONY: all deps build demo test asan tsan clang tidy aarch64 bench fuzz install format clean

all: demo

deps:
	@tools/install-deps.sh

build: deps
	cmake --preset default
	cmake --build --preset default

demo: build
	./build/default/tools/zmtool/zmtool demo

test: build
	ctest --preset default

asan: deps
	cmake --preset asan
	cmake --build --preset asan
	ctest --preset asan

tsan: deps
	cmake --preset tsan
	cmake --build --preset tsan
	ctest --preset tsan

clang:
	@tools/install-deps.sh clang
	cmake --preset clang
	cmake --build --preset clang
	ctest --preset clang

tidy:
	@tools/install-deps.sh clang tidy
	cmake --preset clang
	tools/run-clang-tidy.sh build/clang

aarch64:
	tools/ci-cross-aarch64.sh build/aarch64

bench:
	@tools/install-deps.sh bench
	cmake --preset release
	cmake --build --preset release
	bench/run-benchmarks.sh build/release docs/benchmarks.md

fuzz:
	@tools/install-deps.sh fuzz
	cmake --preset fuzz
	cmake --build --preset fuzz --target fuzzers
	fuzz/run-fuzzers.sh build/fuzz $(FUZZ_SECONDS)

install: build
	cmake --install build/default --prefix $(PREFIX)

format:
	git ls-files '*.h' '*.cpp' | xargs clang-format -i

clean:
	rm -rf build
