# Kestrelgauge: set-up, build, demo and tests on a Debian 12 machine.
# `make demo` and `make test` install what is missing (as root), then build and run.

BUILD      ?= build
ASAN_BUILD ?= build-asan
FUZZ_BUILD ?= build-fuzz
JOBS       ?= 2
# `make fuzz`: seconds per target, which targets (all when empty), more libFuzzer options.
FUZZ_SECONDS ?= 600
FUZZ_TARGETS ?=
FUZZ_FLAGS   ?=

# Everything the build, the tests and the demo need, beyond make and git.
PKGS := g++ cmake pkg-config ca-certificates \
        libgtest-dev libgmock-dev libbenchmark-dev \
        libx11-dev libxext-dev libxt-dev libmotif-dev libxft-dev libxmu-dev libfontconfig-dev \
        zlib1g-dev nlohmann-json3-dev \
        clang libclang-rt-14-dev \
        xvfb xdotool x11-apps x11-utils x11-xserver-utils imagemagick xfonts-base fonts-dejavu-core \
        fonts-ipafont-gothic groff-base \
        lcov time

.PHONY: all deps configure build programs demo test test-release test-asan fuzz bench lcov-check clean

all: build

deps:
	@missing=$$(for p in $(PKGS); do \
	    dpkg-query -W -f='$${Status}\n' $$p 2>/dev/null | grep -q '^install ok installed' || echo $$p; \
	  done); \
	if [ -n "$$missing" ]; then \
	  if [ "$$(id -u)" = 0 ]; then \
	    echo "Installing: $$missing"; \
	    apt-get update && DEBIAN_FRONTEND=noninteractive apt-get install -y --no-install-recommends $$missing || exit 1; \
	  else \
	    echo "These Debian packages are missing. Install them with:"; \
	    echo "  sudo apt-get install -y $$missing"; \
	    exit 1; \
	  fi; \
	fi

$(BUILD)/CMakeCache.txt: | deps
	cmake -S . -B $(BUILD) -DCMAKE_BUILD_TYPE=RelWithDebInfo

configure: deps $(BUILD)/CMakeCache.txt

build: configure
	cmake --build $(BUILD) -j$(JOBS)

# The programs alone: the demo needs no tests built.
programs: configure
	cmake --build $(BUILD) -j$(JOBS) --target kestrel kestrel-viewer kestrel-import kg-help

demo: programs
	@bash tools/run-demo.sh $(BUILD)

test-release: build
	cd $(BUILD) && ctest --output-on-failure -j$(JOBS)

test-asan: deps
	cmake -S . -B $(ASAN_BUILD) -DCMAKE_BUILD_TYPE=Debug -DKG_SANITIZE=ON
	cmake --build $(ASAN_BUILD) -j$(JOBS)
	cd $(ASAN_BUILD) && ctest --output-on-failure -j$(JOBS)

test: test-release test-asan

# Long fuzzing runs: every library instrumented, libFuzzer linked into the targets, each target
# run for FUZZ_SECONDS; fails when any target crashes (docs/fuzzing.md).
fuzz: deps
	CC=clang CXX=clang++ cmake -S . -B $(FUZZ_BUILD) -DCMAKE_C_COMPILER=clang -DCMAKE_CXX_COMPILER=clang++ \
	    -DCMAKE_BUILD_TYPE=RelWithDebInfo -DKG_LIBFUZZER=ON
	cmake --build $(FUZZ_BUILD) -j$(JOBS) --target kg_fuzz_targets
	FUZZ_FLAGS="$(FUZZ_FLAGS)" bash fuzz/run_fuzz.sh $(FUZZ_BUILD) $(FUZZ_SECONDS) $(FUZZ_TARGETS)

bench: build
	@for b in bench/*.sh; do [ -f "$$b" ] && bash "$$b" $(BUILD) || exit 1; done
	@for b in $(BUILD)/bench/*_bench; do [ -x "$$b" ] && "$$b" || exit 1; done

# kestrel's figures against lcov's on real coverage, with timings of both.
lcov-check: build
	@bash bench/lcov_check.sh $(BUILD)

clean:
	rm -rf $(BUILD) $(ASAN_BUILD)
