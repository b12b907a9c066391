# The front door: `make demo` shows the whole on this machine, `make test` tests it.
# Everything else is a CMake preset; see CMakePresets.json.
JOBS ?= $(shell nproc)
BENCH := $(NAME)
# A compiler cache then serves every clone and every build folder alike.
export CCACHE_BASEDIR := $(CURDIR)
export CCACHE_NOHASHDIR := 1

.PHONY: demo test bench compare packages build release asan tsan analysis format format-check tidy clean

packages:
	@Packaging/install-packages.sh

build: packages
	cmake --preset dev >/dev/null
	cmake --build --preset dev -j $(JOBS)

demo: build
	bash Tools/demo/demo.sh build/dev

test: build
	ctest --preset dev -j $(JOBS)

release: packages
	cmake --preset release >/dev/null
	cmake --build --preset release -j $(JOBS)

# All benchmarks, or one: make bench NAME=requests
bench: release
	@python3 Benchmarks/run.py build/release $(BENCH)

# The same files in zo, git and Subversion, side by side; needs the packages git and subversion.
compare: release
	@python3 Benchmarks/versioning/compare.py build/release

asan: LEFT_OUT := build
tsan: LEFT_OUT := build|words
asan tsan: packages
	cmake --preset $@ >/dev/null
	cmake --build --preset $@ -j $(JOBS)
	ctest --preset $@ -j $(JOBS) -LE '$(LEFT_OUT)'

# clang checks the lock annotations; nothing is run.
analysis: packages
	cmake --preset analysis >/dev/null
	cmake --build --preset analysis -j $(JOBS)

SOURCES = $(shell git ls-files '*.h' '*.cpp')
format:
	clang-format -i $(SOURCES)
format-check:
	clang-format --dry-run -Werror $(SOURCES)

# The same warnings and clang-tidy's in one pass over each file, so a whole build is not needed first.
tidy: packages
	cmake --preset analysis >/dev/null
	cmake --build --preset analysis -j $(JOBS) --target zo_pch
	python3 Tools/dev/tidy.py build/analysis

clean:
	rm -rf build
