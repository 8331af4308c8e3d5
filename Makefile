# Tessarine: `make demo` runs the main job (the command-line tool on the samples), `make test` builds and passes every
# test (then again under AddressSanitizer + UndefinedBehaviorSanitizer, with a
# short run of every fuzz target), `make bench` runs the benchmarks.
# Each target installs missing Debian packages first.

BUILD ?= build
SAN_BUILD ?= build-san
BENCH_BUILD ?= build-bench
JOBS ?= $(shell nproc)
FUZZ_SECONDS ?= 300

.PHONY: all deps build demo tour test test-plain test-san fuzz bench install clean

all: build

deps:
	@tools/install-deps.sh

build: deps
	cmake -S . -B $(BUILD) -DCMAKE_BUILD_TYPE=RelWithDebInfo
	cmake --build $(BUILD) -j $(JOBS)

# The main job: the command-line tool on the samples, outputs in out/.
demo: build
	tools/demo-job.sh $(BUILD)/tools/cli/tessarine out

# The API tour: an example program calling the library directly.
tour: build
	$(BUILD)/tools/tessarine_demo

test: test-plain test-san

test-plain: build
	ctest --test-dir $(BUILD) --output-on-failure -j $(JOBS)

$(SAN_BUILD)/CMakeCache.txt:
	CC=clang CXX=clang++ cmake -S . -B $(SAN_BUILD) -DCMAKE_BUILD_TYPE=RelWithDebInfo \
	  -DTESSARINE_SANITIZE=ON -DTESSARINE_FUZZ=ON

test-san: deps $(SAN_BUILD)/CMakeCache.txt
	cmake --build $(SAN_BUILD) -j $(JOBS)
	ASAN_OPTIONS=detect_leaks=1:abort_on_error=0 UBSAN_OPTIONS=print_stacktrace=1 \
	  ctest --test-dir $(SAN_BUILD) --output-on-failure -j $(JOBS)

# The sanitizer tests include a short run of every fuzz target; this runs them longer.
fuzz: test-san
	tools/run-fuzz.sh $(SAN_BUILD)/fuzz fuzz/corpus $(FUZZ_SECONDS)

bench: deps
	cmake -S . -B $(BENCH_BUILD) -DCMAKE_BUILD_TYPE=Release -DTESSARINE_BENCH=ON -DTESSARINE_TESTS=OFF
	cmake --build $(BENCH_BUILD) -j $(JOBS)
	tools/run-benchmarks.sh $(BENCH_BUILD)/bench

install: build
	cmake --install $(BUILD)

clean:
	rm -rf $(BUILD) $(SAN_BUILD) $(BENCH_BUILD)
