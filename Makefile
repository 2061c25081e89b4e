# Entry points; see README.md. Every target installs what is missing first.
BUILD ?= build
ASAN_BUILD ?= build-asan
FUZZ_BUILD ?= build-fuzz
JOBS ?= $(shell nproc)
FUZZ_SECONDS ?= 60
FUZZ_SMOKE_SECONDS ?= 30
CMAKE_FLAGS ?=
PREFIX ?= /usr/local

.PHONY: all deps configure build tool run test install asan-test bench fuzz fuzz-build fuzz-smoke format clean

all: build

deps:
	@bash scripts/install-deps.sh

configure: deps
	cmake -S . -B $(BUILD) -DCMAKE_BUILD_TYPE=RelWithDebInfo $(CMAKE_FLAGS) >/dev/null

build: configure
	cmake --build $(BUILD) -j$(JOBS)

# The tool and its libraries only: no tests or benchmarks.
tool: configure
	cmake --build $(BUILD) -j$(JOBS) --target nitf-tool

# The main job: the nitf tool on the project's own sample.
run: tool
	bash scripts/run-sample.sh $(BUILD)

# The tool, the libraries, the headers and the package files under PREFIX (make install PREFIX=DIR).
install: tool
	cmake --install $(BUILD) --prefix $(PREFIX)

test: build
	ctest --test-dir $(BUILD) --output-on-failure -j$(JOBS)

# The same tests under AddressSanitizer and UndefinedBehaviorSanitizer.
asan-test: deps
	cmake -S . -B $(ASAN_BUILD) -DCMAKE_BUILD_TYPE=Debug -DNITF_SANITIZE=ON -DNITF_BUILD_BENCH=OFF $(CMAKE_FLAGS) >/dev/null
	cmake --build $(ASAN_BUILD) -j$(JOBS)
	ASAN_OPTIONS=detect_leaks=1 UBSAN_OPTIONS=print_stacktrace=1 ctest --test-dir $(ASAN_BUILD) --output-on-failure -j$(JOBS)

bench: build
	$(BUILD)/bench/nitf-bench

# libFuzzer targets (clang), each run for FUZZ_SECONDS seconds from the test corpus when it is present.
fuzz: fuzz-build
	bash scripts/run-fuzzers.sh $(FUZZ_BUILD) $(FUZZ_SECONDS)

# Every target for a short while: what CI runs.
fuzz-smoke: fuzz-build
	bash scripts/run-fuzzers.sh $(FUZZ_BUILD) $(FUZZ_SMOKE_SECONDS)

fuzz-build: deps
	CC=clang CXX=clang++ cmake -S . -B $(FUZZ_BUILD) -DCMAKE_BUILD_TYPE=RelWithDebInfo -DNITF_BUILD_FUZZ=ON \
	    -DNITF_BUILD_TESTS=OFF -DNITF_BUILD_BENCH=OFF >/dev/null
	cmake --build $(FUZZ_BUILD) -j$(JOBS)

format:
	clang-format -i $$(git ls-files '*.cpp' '*.h')

clean:
	rm -rf $(BUILD) $(ASAN_BUILD) $(FUZZ_BUILD)
