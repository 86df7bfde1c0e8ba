# The daily commands. `make demo` and `make test` do everything on a fresh Debian 12 machine: install what is missing by
# package name, configure, build and run.

.PHONY: build demo test clean
JOBS ?= $(shell nproc)

build:
	@tools/packages.sh build
	cmake --preset release
	cmake --build --preset release -j $(JOBS)

test: build
	@tools/packages.sh test
	ctest --preset release -j $(JOBS)

clean:
	rm -rf build
