# The daily commands. Each does everything on a fresh Debian 12 machine: it installs what is missing by package name,
# configures a preset of CMakePresets.json, builds and runs.
#
# JOBS=n sets how many cores to use, PREFIX=folder where to install, FUZZ_SECONDS=n how long each fuzz target runs,
# MUTANTS=pattern which mutants to try.

JOBS ?= $(shell nproc)
PREFIX ?= /usr/local
FUZZ_SECONDS ?= 60
MUTANTS ?= .

# The lists (*.def) are laid out by hand.
sources = $(shell git ls-files '*.cpp' '*.h' '*.c')

.PHONY: help build interfaces tools packages
.PHONY: demo test test-long bench lint format asan tsan fuzz mutants coverage install clean
.DEFAULT_GOAL := help

help:
	@echo 'make build      the library: build/release/libqtb.so'
	@echo 'make interfaces  the companions that stand in for a BLAS: build/release/interfaces'
	@echo 'make tools      qtb-info and qtb-trace: build/release/tools'
	@echo 'make packages   Debian packages of the library, its development files and its tools: build/release/packages'
	@echo 'make demo       builds and runs the examples'
	@echo 'make test       builds everything and runs the tests'
	@echo 'make test-long  more cases, programs of others, both sanitizers, and the fuzz targets'
	@echo 'make bench      benchmarks, beside PEER=library; bench/run.sh has the other variables'
	@echo 'make lint       formatting and static analysis'
	@echo 'make format     formats the sources'
	@echo 'make asan       the tests under the address and undefined-behaviour sanitizers'
	@echo 'make tsan       the tests under the thread sanitizer'
	@echo 'make fuzz       $(FUZZ_SECONDS) seconds of each fuzz target'
	@echo 'make mutants    breaks the library in one place at a time: do the tests see it? MUTANTS=pattern chooses'
	@echo 'make coverage   lines and branches that the tests reach'
	@echo 'make install    installs below PREFIX=$(PREFIX)'
	@echo 'make clean      removes build/'

build:
	@tools/packages.sh build
	cmake --preset release
	cmake --build --preset release -j $(JOBS) --target qtb

interfaces:
	@tools/packages.sh build
	cmake --preset release
	cmake --build --preset release -j $(JOBS) --target interfaces

tools:
	@tools/packages.sh build
	cmake --preset release
	cmake --build --preset release -j $(JOBS) --target tools

packages:
	@tools/packages.sh build packages
	cmake --preset release
	cmake --build --preset release -j $(JOBS) --target packages

demo:
	@tools/packages.sh demo
	cmake --preset release -D QTB_BUILD_EXAMPLES=ON
	cmake --build --preset release -j $(JOBS) --target examples
	build/release/examples/least_squares examples/data/longley.csv examples/data/longley-certified.csv
	build/release/examples/matrix_product
	build/release/examples/linear_systems

test:
	@tools/packages.sh build test
	cmake --preset release -D QTB_BUILD_TESTS=ON
	cmake --build --preset release -j $(JOBS)
	ctest --preset release -j $(JOBS)

test-long: asan tsan fuzz
	@tools/packages.sh build test packages ecosystem
	cmake --preset release -D QTB_BUILD_TESTS=ON
	cmake --build --preset release -j $(JOBS)
	ctest --preset long -j $(JOBS)

bench:
	@tools/packages.sh build bench
	cmake --preset bench
	cmake --build --preset bench -j $(JOBS) --target bench

asan:
	@tools/packages.sh build test sanitizers
	cmake --preset asan
	cmake --build --preset asan -j $(JOBS)
	ctest --preset asan -j $(JOBS)

# The detector's shadow memory has fixed addresses, which address-space randomisation can take from it.
tsan:
	@tools/packages.sh build test sanitizers
	cmake --preset tsan
	cmake --build --preset tsan -j $(JOBS)
	setarch -R ctest --preset tsan -j $(JOBS)

fuzz:
	@tools/packages.sh build fuzz
	cmake --preset fuzz -D QTB_FUZZ_SECONDS=$(FUZZ_SECONDS)
	cmake --build --preset fuzz -j $(JOBS) --target fuzz_targets
	ctest --preset fuzz -j $(JOBS)

mutants:
	@tools/packages.sh build test
	JOBS=$(JOBS) tests/mutants/run.sh '$(MUTANTS)'

coverage:
	@tools/packages.sh build test coverage
	cmake --preset coverage
	cmake --build --preset coverage -j $(JOBS)
	ctest --preset coverage -j $(JOBS)
	gcovr --root . --filter blas/ --filter service/ --exclude-throw-branches --print-summary \
	  --html-details build/coverage/coverage.html build/coverage

lint:
	@tools/packages.sh build lint
	clang-format --dry-run -Werror $(sources)
	shellcheck $(shell git ls-files '*.sh' .ci/run)
	cmake --preset lint
	run-clang-tidy -quiet -p build/lint -j $(JOBS)

format:
	@tools/packages.sh lint
	clang-format -i $(sources)

install: build interfaces tools
	cmake --install build/release --prefix $(PREFIX)

clean:
	rm -rf build
