# Two entry points for a fresh Debian 12 machine (run as root, or with sudo
# rights for the package step): `make run` and `make test`; `make fuzz` and
# `make bench` for the fuzz run and the benchmarks; `make install` (PREFIX,
# DESTDIR) installs the library, its header, pkg-config and CMake files and
# the tools.
JOBS ?= $(shell nproc)
PACKAGES := cmake make g++ clang libclang-rt-14-dev libicu-dev libgtest-dev libgmock-dev libbenchmark-dev locales \
  nlohmann-json3-dev pkgconf python3-pandas python3-numpy python3-pytest
# Debian's own interpreter, which sees the packages above.
PYTHON := /usr/bin/python3
PREFIX ?= /usr/local
SUDO := $(shell [ "$$(id -u)" = 0 ] || echo sudo)

.PHONY: run test deps deps32 build build-asan locales bench fuzz tsan test32 clean install mutate

deps:
	@missing=$$(for p in $(PACKAGES); do dpkg -s $$p >/dev/null 2>&1 || echo $$p; done); \
	if [ -n "$$missing" ]; then \
	  echo "installing:" $$missing; \
	  $(SUDO) apt-get update -q && DEBIAN_FRONTEND=noninteractive $(SUDO) apt-get install -y -q $$missing; \
	fi

# The code-page tests need real single-byte and multibyte locales.
locales: deps
	@$(SUDO) sh tools/make-test-locales.sh

build: deps
	cmake -S . -B build -DCMAKE_BUILD_TYPE=RelWithDebInfo >/dev/null
	cmake --build build -j $(JOBS)

build-asan: deps
	cmake -S . -B build-asan -DCMAKE_BUILD_TYPE=Debug -DQORA_SANITIZE=ON >/dev/null
	cmake --build build-asan -j $(JOBS)

install: build
	DESTDIR=$(DESTDIR) cmake --install build --prefix $(PREFIX)

run: build
	./build/tools/qoradump examples/sample.qsf

# The Python tests run last, against each build: for the sanitizer build the
# sanitizer and C++ runtimes are preloaded, as the interpreter links neither,
# and the interpreter's own allocations are not leak-checked.
test: build build-asan locales
	cd build && ctest --output-on-failure -j $(JOBS)
	cd build-asan && ASAN_OPTIONS=detect_leaks=1 ctest --output-on-failure -j $(JOBS)
	cd python && QORAIO_LIBRARY_DIR=../build-asan ASAN_OPTIONS=detect_leaks=0 \
	  LD_PRELOAD="$$(g++ -print-file-name=libasan.so) $$(g++ -print-file-name=libstdc++.so)" \
	  $(PYTHON) -m pytest -q -p no:cacheprovider tests
	cd python && $(PYTHON) -m pytest -q -p no:cacheprovider tests

# The library and the suite built for i386 on the same machine, which proves
# the layouts the public header declares for a 32-bit process.
# TEST32_ARGS narrows the run (CI: -R api_tests when time is short).
PACKAGES32 := g++-multilib libicu-dev:i386 libgtest-dev:i386 libgmock-dev:i386
TEST32_ARGS ?=
deps32: deps
	@missing=$$(for p in $(PACKAGES32); do dpkg -s $$p >/dev/null 2>&1 || echo $$p; done); \
	if [ -n "$$missing" ]; then \
	  echo "installing:" $$missing; \
	  $(SUDO) dpkg --add-architecture i386; \
	  $(SUDO) apt-get update -q && DEBIAN_FRONTEND=noninteractive $(SUDO) apt-get install -y -q $$missing; \
	fi

test32: deps32 locales
	cmake -S . -B build-32 -DCMAKE_BUILD_TYPE=RelWithDebInfo -DCMAKE_C_FLAGS=-m32 \
	  -DCMAKE_CXX_FLAGS=-m32 >/dev/null
	cmake --build build-32 -j $(JOBS)
	cd build-32 && ctest --output-on-failure -j $(JOBS) $(TEST32_ARGS)

# The suite again under ThreadSanitizer, in a build of its own; the threads
# test is what it is there for.
tsan: deps locales
	cmake -S . -B build-tsan -DCMAKE_BUILD_TYPE=RelWithDebInfo -DQORA_TSAN=ON >/dev/null
	cmake --build build-tsan -j $(JOBS)
	cd build-tsan && TSAN_OPTIONS="halt_on_error=1 second_deadlock_stack=1" \
	  ctest --output-on-failure -j $(JOBS)

# Seeds from the fixture builder, then a bounded run of each fuzzer: the
# reader on file bytes, and the calls on sequences a caller could make. New
# inputs collect in build-fuzz/corpus*, crashes in build-fuzz/artifacts.
FUZZ_TIME ?= 60
FUZZ_FLAGS = -max_total_time=$(FUZZ_TIME) -timeout=10 -rss_limit_mb=4096 -print_final_stats=1 \
  -artifact_prefix=build-fuzz/artifacts/
fuzz: deps
	CC=clang CXX=clang++ cmake -S . -B build-fuzz -DCMAKE_BUILD_TYPE=RelWithDebInfo -DQORA_FUZZ=ON >/dev/null
	cmake --build build-fuzz -j $(JOBS) --target open_read_fuzz call_sequence_fuzz fuzz_seeds
	mkdir -p build-fuzz/seeds build-fuzz/corpus build-fuzz/corpus-calls build-fuzz/artifacts
	./build-fuzz/tests/fuzz/fuzz_seeds build-fuzz/seeds
	./build-fuzz/tests/fuzz/open_read_fuzz $(FUZZ_FLAGS) -max_len=65536 build-fuzz/corpus build-fuzz/seeds
	./build-fuzz/tests/fuzz/call_sequence_fuzz $(FUZZ_FLAGS) -max_len=4096 build-fuzz/corpus-calls

bench: deps
	cmake -S . -B build-bench -DCMAKE_BUILD_TYPE=Release -DQORA_BENCH=ON -DQORA_TESTS=OFF >/dev/null
	cmake --build build-bench -j $(JOBS) --target qora_bench qoraio_cases
	./build-bench/bench/qora_bench
	QORAIO_LIBRARY_DIR=build-bench $(PYTHON) bench/python_bench.py

clean:
	rm -rf build build-asan build-fuzz build-bench build-tsan build-32 build-mutate

# How many small faults the tests catch: a fixed sample of mutants of the
# library, each built in build-mutate and run against the release tests.
mutate: deps locales
	$(PYTHON) tools/mutate.py
