# The two commands of vox: `make test` and `make demo`.
BUILD ?= build
JOBS ?= $(shell nproc)

.PHONY: all deps configure build test demo install clean test-asan test-tsan fuzz bench test-windows

all: build

deps:
	@scripts/install-deps.sh

configure: deps
	@cmake -S . -B $(BUILD) -G Ninja -DCMAKE_BUILD_TYPE=RelWithDebInfo >/dev/null

build: configure
	@cmake --build $(BUILD) -j $(JOBS)

test: build
	@ctest --test-dir $(BUILD) --output-on-failure -j $(JOBS)

demo: build
	@scripts/demo.sh $(BUILD)

install: build
	@cmake --install $(BUILD) --prefix $(or $(PREFIX),$(CURDIR)/out)

clean:
	@rm -rf $(BUILD)

# ---- Hardening: the suite under sanitizers, the fuzz targets and the benchmarks, each in a
# build folder of its own (.ci/run calls them after `make test`).
#
# Sanitizer runtime options: leaks count; undefined behaviour stops the test. The library
# catches processor faults in engine calls with handlers of its own, and its tests check that
# a fault outside a guard still kills the process by its signal: the sanitizers must leave
# those signals alone rather than turn them into a report and an exit code.
SIGNALS_TO_US = handle_segv=0:handle_sigbus=0:handle_sigfpe=0:handle_sigill=0
SANITIZER_ENV = ASAN_OPTIONS=detect_leaks=1:$(SIGNALS_TO_US):$(ASAN_OPTIONS) \
  UBSAN_OPTIONS=print_stacktrace=1:halt_on_error=1:$(UBSAN_OPTIONS) \
  TSAN_OPTIONS=halt_on_error=1:second_deadlock_stack=1:$(SIGNALS_TO_US):$(TSAN_OPTIONS)
FUZZ_SECONDS ?= 60

# The whole suite with AddressSanitizer and UndefinedBehaviorSanitizer.
test-asan: deps
	@cmake -S . -B build-asan -G Ninja -DCMAKE_BUILD_TYPE=Debug -DVOX_SANITIZE=address >/dev/null
	@cmake --build build-asan -j $(JOBS)
	@$(SANITIZER_ENV) ctest --test-dir build-asan --output-on-failure -j $(JOBS)

# The threaded tests (ctest label "threads") with ThreadSanitizer; only they are built.
test-tsan: deps
	@cmake -S . -B build-tsan -G Ninja -DCMAKE_BUILD_TYPE=Debug -DVOX_SANITIZE=thread >/dev/null
	@cmake --build build-tsan --target vox_threaded_tests -j $(JOBS)
	@$(SANITIZER_ENV) ctest --test-dir build-tsan --output-on-failure -j $(JOBS) -L threads

# Every fuzz target for FUZZ_SECONDS seconds (clang, build-fuzz).
fuzz: deps
	@scripts/fuzz.sh $(FUZZ_SECONDS)

# The benchmarks with their references, as one table (build-bench).
bench: deps
	@scripts/bench.sh

# ---- Windows x64: cross-build with MinGW-w64 into build-win and run the Windows tests under
# Wine (installs the cross compiler and Wine when missing).
test-windows:
	@scripts/test-windows.sh build-win
