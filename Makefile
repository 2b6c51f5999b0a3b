# Thin wrapper around CMake; see README.md.
GEN := $(shell command -v ninja >/dev/null 2>&1 && echo "-G Ninja")
JOBS ?= $(shell nproc 2>/dev/null || echo 2)
SAN_ENV := ASAN_OPTIONS=halt_on_error=1:detect_leaks=1:abort_on_error=0 \
           UBSAN_OPTIONS=halt_on_error=1:print_stacktrace=1

FUZZ_SECONDS ?= 60
FUZZ_TARGETS := $(basename $(notdir $(wildcard fuzz/*_fuzzer.cpp)))

.PHONY: all build test test-plain test-asan demo bench fuzz clean

all: build

build:
	cmake -S . -B build $(GEN) -DCMAKE_BUILD_TYPE=RelWithDebInfo
	cmake --build build -j $(JOBS)

test: test-plain test-asan

test-plain: build
	cd build && ctest --output-on-failure -j $(JOBS)

test-asan:
	cmake -S . -B build-asan $(GEN) -DCMAKE_BUILD_TYPE=Debug -DQOR_SANITIZE=ON
	cmake --build build-asan -j $(JOBS)
	cd build-asan && $(SAN_ENV) ctest --output-on-failure -j $(JOBS)

demo: build
	./example/demo.sh build

bench:
	cmake -S . -B build-bench $(GEN) -DCMAKE_BUILD_TYPE=Release -DQOR_BENCH=ON -DQOR_TESTS=OFF
	cmake --build build-bench -j $(JOBS)

# Each target runs FUZZ_SECONDS from its seeds; what it adds to its corpus stays in
# build-fuzz/corpus, a finding is written to build-fuzz/ and stops the run.
fuzz:
	dpkg -s libclang-rt-14-dev >/dev/null 2>&1 || { apt-get update && \
	  DEBIAN_FRONTEND=noninteractive apt-get install -y --no-install-recommends libclang-rt-14-dev; }
	cmake -S . -B build-fuzz $(GEN) -DCMAKE_CXX_COMPILER=clang++ -DCMAKE_BUILD_TYPE=RelWithDebInfo \
	  -DQOR_FUZZ=ON -DQOR_TESTS=OFF
	cmake --build build-fuzz -j $(JOBS) --target qor_fuzzers
	for target in $(FUZZ_TARGETS); do \
	  mkdir -p build-fuzz/corpus/$$target && \
	  build-fuzz/fuzz/$$target -max_total_time=$(FUZZ_SECONDS) -timeout=60 -rss_limit_mb=2048 \
	    -print_final_stats=1 -artifact_prefix=build-fuzz/$$target- \
	    build-fuzz/corpus/$$target fuzz/corpus/$$target || exit 1; \
	done

clean:
	rm -rf build build-asan build-bench build-fuzz
