# The front door: `make demo` shows the whole on this machine, `make test` tests it.
# Everything else is a CMake preset; see CMakePresets.json.
JOBS ?= $(shell nproc)
BENCH := $(NAME)
# A compiler cache then serves every clone and every build folder alike.
export CCACHE_BASEDIR := $(CURDIR)
export CCACHE_NOHASHDIR := 1

# By its list of headers, without a run of the preprocessor before each compilation.
export CCACHE_DEPEND := 1

.PHONY: demo test soak campaign bench compare fuzz packages build release asan tsan analysis format format-check locks tidy clean

packages:
	@Packaging/install-packages.sh

build: packages
	cmake --preset dev >/dev/null
	cmake --build --preset dev -j $(JOBS)

demo: build
	bash Tools/demo/demo.sh build/dev

# REPEAT=2 runs a test that failed once more, and tells both runs.
REPEAT ?= 1
test: build
	ctest --preset dev -j $(JOBS) --repeat until-pass:$(REPEAT)

# For long runs, a build of the tests that is optimized.
define build-soak
	cmake --preset release -B build/soak -D ZO_BUILD_TESTS=ON -D ZO_BUILD_BENCHMARKS=OFF -D ZO_BUILD_QT=OFF >/dev/null
	cmake --build build/soak -j $(JOBS) --target zohub $(1)
endef

# The tests of the request chain again and again, until one fails: make soak COUNT=1000
COUNT ?= 100
soak: packages
	$(call build-soak,test_request_chain test_request_chain_hub test_ostnet test_connection test_faults)
	@python3 Tools/dev/soak.py build/soak $(COUNT)

# Two users at work while the network fails them, in so many ways: make campaign SCHEDULES=20000
SCHEDULES ?= 500
campaign: packages
	$(call build-soak,campaign)
	build/soak/tests/campaign --schedules $(SCHEDULES) --jobs $$((2 * $(JOBS)))

release: packages
	cmake --preset release >/dev/null
	cmake --build --preset release -j $(JOBS)

# All benchmarks, or one: make bench NAME=requests
bench: release
	@python3 Benchmarks/run.py build/release $(BENCH)

# The same files in zo, git and Subversion, side by side; needs the packages git and subversion.
compare: release
	@python3 Benchmarks/versioning/compare.py build/release

# The label words: programs whose words and files are looked at; single: one thread and no other. The thread
# sanitizer leaves zo out too, which starts anew for each command (label e2e): make tsan ZO=1 takes it along.
asan: LEFT_OUT := build|words
tsan: LEFT_OUT := build|words|single$(if $(ZO),,|e2e)
# QT=OFF leaves the Qt windows out; HUB=PATH takes that zohub for the tests and leaves out the hub's own.
QT ?= ON
asan tsan: packages
	cmake --preset $@ -D ZO_BUILD_QT=$(QT) -D ZO_HUB_PROGRAM=$(HUB) >/dev/null
	cmake --build --preset $@ -j $(JOBS)
	ctest --preset $@ -j $(JOBS) -LE '$(LEFT_OUT)'

# One parser against input that nobody wrote: make fuzz NAME=xmp SECONDS=1800 (or json, form, layout)
SECONDS ?= 60
fuzz: packages
	cmake --preset fuzz >/dev/null
	cmake --build --preset fuzz -j $(JOBS) --target fuzz_$(NAME)
	Tests/Fuzz/run.sh build/fuzz $(NAME) $(SECONDS)

# clang checks the lock annotations; nothing is run.
analysis: packages
	cmake --preset analysis >/dev/null
	cmake --build --preset analysis -j $(JOBS)

SOURCES = $(shell git ls-files '*.h' '*.cpp')
format:
	@clang-format -i $(SOURCES)
format-check:
	@clang-format --dry-run -Werror $(SOURCES)

# The same over the sources in groups, without making any code of them.
locks: packages
	cmake --preset analysis -B build/locks -D ZO_UNITY_BUILD=ON >/dev/null
	python3 Tools/dev/tidy.py --locks build/locks

# clang-tidy over all sources, or over those that changed since a commit: make tidy SINCE=HEAD~20
tidy: packages
	cmake --preset analysis >/dev/null
	python3 Tools/dev/tidy.py $(if $(SINCE),--since $(SINCE)) build/analysis

clean:
	rm -rf build
