# The two commands of vox: `make test` and `make demo`.
BUILD ?= build
JOBS ?= $(shell nproc)

.PHONY: all deps configure build test demo install clean

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
