# The front door. Each target installs what it lacks, says what it does and ends with an error
# when anything failed. Everything built lies under build/.

SHELL := /bin/bash
.SHELLFLAGS := -euo pipefail -c
.DEFAULT_GOAL := help
.NOTPARALLEL:

JOBS ?= $(shell nproc)
FUZZ_SECONDS ?= 60
IMAGE ?=
JOB ?=

setup := scripts/setup-linux.sh
# A compiler cache is used where there is one.
launcher := $(if $(shell command -v ccache),-DCMAKE_CXX_COMPILER_LAUNCHER=ccache)
# ThreadSanitizer needs a memory layout that is not fully random.
fixed_layout := $(shell setarch -R true 2>/dev/null && echo setarch -R)

say = @echo "== $(1)"
# $(call configure,PRESET,OPTIONS)
configure = cmake --preset $(1) $(launcher) $(2) >build/$(1).configure.log || \
	{ cat build/$(1).configure.log; exit 1; }
# $(call compile,PRESET,TARGETS)
compile = cmake --build --preset $(1) -j $(JOBS) $(if $(2),--target $(2))

.PHONY: help build debug demo gallery gallery-dialogs gallery-dialogs-windows test bench windows test-windows sanitize tsan fuzz check format \
	clean clean-cache

help: ## Show this list
	@echo "Zalmo Graphics: make TARGET"
	@grep -hE '^[a-z-]+: .*##' Makefile | sed -E 's/^([a-z-]+): .*## /\1|/' | \
		awk -F'|' '{ printf "  %-14s%s\n", $$1, $$2 }'
	@echo "A photo of your own: make demo IMAGE=my.jpg"

build: | build/.folder ## Build Graphics.qvp and qvrun, optimized
	$(call say,Building Graphics.qvp and qvrun)
	@$(setup) build
	@$(call configure,release,-DZM_BUILD_TESTS=OFF -DZM_BUILD_FUZZ=OFF)
	@$(call compile,release)
	$(call say,Done: build/release/bin/Graphics.qvp and build/release/bin/qvrun)

debug: | build/.folder ## Build everything for the debugger
	@$(setup) test
	@$(call configure,debug)
	@$(call compile,debug)

demo: build ## Run an example job on IMAGE=my.jpg, or on a sample picture drawn here
	@scripts/demo.sh build/release/bin "$(IMAGE)" "$(JOB)"

gallery: build ## Make the pictures of docs/gallery anew
	$(call say,Making the pictures of docs/gallery)
	@scripts/make_gallery.py build/release/bin

gallery-dialogs: | build/.folder ## Make the pictures of the dialogs anew
	$(call say,Making the pictures of docs/gallery/dialogs)
	@$(setup) test
	@$(call configure,release,-DZM_BUILD_TESTS=ON)
	@$(call compile,release,gtk_gallery)
	@scripts/dialog_gallery.sh build/release/bin

gallery-dialogs-windows: windows ## Make the pictures of the Windows dialogs anew, under Wine
	@scripts/setup-windows.sh test
	@scripts/dialog_gallery_windows.sh build/win32/bin

test: | build/.folder ## Build and run all tests
	$(call say,Testing: all test programs, optimized)
	@$(setup) test
	@$(call configure,release,-DZM_BUILD_TESTS=ON -DZM_BUILD_FUZZ=ON)
	@$(call compile,release)
	@ctest --preset release -j $(JOBS)

bench: | build/.folder ## Measure speed, with memcpy of the same bytes as the yardstick
	$(call say,Measuring)
	@$(setup) bench
	@$(call configure,release,-DZM_BUILD_BENCH=ON)
	@$(call compile,release)
	@scripts/bench.sh build/release/bin

windows: | build/.folder ## Build the 32-bit Windows Graphics.qvp and qvrun.exe
	$(call say,Building for 32-bit Windows)
	@scripts/setup-windows.sh
	@$(call configure,win32)
	@$(call compile,win32)
	$(call say,Done: build/win32/bin/Graphics.qvp and build/win32/bin/qvrun.exe)

test-windows: windows ## Run all tests and an example job of the Windows build under Wine
	@scripts/setup-windows.sh test
	$(call say,Testing the Windows build under Wine)
	@scripts/test-windows.sh -j $(JOBS)

sanitize: | build/.folder ## Run all tests with AddressSanitizer and UndefinedBehaviorSanitizer
	$(call say,Testing with AddressSanitizer and UndefinedBehaviorSanitizer)
	@$(setup) test
	@$(call configure,asan-ubsan)
	@$(call compile,asan-ubsan)
	@ctest --preset asan-ubsan -j $(JOBS)

tsan: | build/.folder ## Run the tests of threads with ThreadSanitizer
	$(call say,Testing threads with ThreadSanitizer)
	@$(setup) test
	@$(call configure,tsan)
	@$(call compile,tsan)
	@$(fixed_layout) ctest --preset tsan -j $(JOBS)

fuzz: | build/.folder ## Fuzz each target for FUZZ_SECONDS=60 seconds
	$(call say,Fuzzing each target for $(FUZZ_SECONDS) seconds)
	@$(setup) fuzz
	@$(call configure,fuzz)
	@$(call compile,fuzz)
	@scripts/fuzz.sh build/fuzz/bin $(FUZZ_SECONDS)

check: | build/.folder ## Check format, lint, sizes and layers
	$(call say,Checking format)
	@$(setup) check
	@scripts/sources.sh | xargs -0 clang-format --dry-run --Werror
	$(call say,Checking sizes and layers)
	@python3 scripts/check_sizes.py
	@python3 tests/build/check_layering.py
	$(call say,Checking with clang-tidy)
	@$(call configure,debug)
	@scripts/tidy.sh build/debug $(JOBS)

format: ## Bring all sources into the common format
	@$(setup) check
	@scripts/sources.sh | xargs -0 clang-format -i

clean: ## Remove everything built
	rm -rf build

clean-cache: ## Remove the Windows libraries and the Wine folder, which lie outside the tree
	@scripts/clean-cache.sh

build/.folder:
	@mkdir -p build
	@touch $@
