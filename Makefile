# Two entry points for a fresh Debian 12 machine (run as root, or with sudo
# rights for the package step): `make run` and `make test`.
JOBS ?= $(shell nproc)
PACKAGES := cmake make g++ clang libicu-dev libgtest-dev libgmock-dev libbenchmark-dev locales
SUDO := $(shell [ "$$(id -u)" = 0 ] || echo sudo)

.PHONY: run test deps build build-asan locales bench fuzz clean

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

run: build
	./build/tools/qoradates

test: build build-asan locales
	cd build && ctest --output-on-failure -j $(JOBS)
	cd build-asan && ASAN_OPTIONS=detect_leaks=1 ctest --output-on-failure -j $(JOBS)

clean:
	rm -rf build build-asan
