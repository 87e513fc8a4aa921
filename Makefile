# Two commands do everything on a fresh Debian machine: `make demo` and `make test`.
# Each target installs the Debian packages it needs and no more.
BUILD_PACKAGES   := cmake ninja-build g++ pkg-config libicu-dev libboost-thread-dev nlohmann-json3-dev
TEST_PACKAGES    := $(BUILD_PACKAGES) googletest libgtest-dev python3 binutils abigail-tools doxygen clang
BENCH_PACKAGES   := $(BUILD_PACKAGES) libbenchmark-dev libssl-dev libinih-dev libabsl-dev
FUZZ_PACKAGES    := $(BUILD_PACKAGES) clang libclang-rt-14-dev
PACKAGE_PACKAGES := $(BUILD_PACKAGES) dpkg-dev file doxygen
DOCS_PACKAGES    := $(BUILD_PACKAGES) doxygen

BUILD       ?= build
ASAN_BUILD  ?= build-asan
TSAN_BUILD  ?= build-tsan
BENCH_BUILD ?= build-bench
FUZZ_BUILD  ?= build-fuzz
LOCKS_BUILD ?= build-locks
DOCS_BUILD  ?= build-docs
PACKAGE_BUILD ?= build-package
CMAKE_FLAGS := -G Ninja -DCMAKE_BUILD_TYPE=RelWithDebInfo
CTEST_FLAGS := --output-on-failure -j2
# Seconds each fuzz target runs under `make fuzz`.
FUZZ_SECONDS ?= 60
# Seconds the soak test runs under `make soak`.
SOAK_SECONDS ?= 60

.PHONY: all deps deps-test deps-bench deps-fuzz deps-package build demo test test-normal \
        test-asan test-tsan test-locks bench fuzz soak install package package-check clean format abi-baseline docs deps-docs

all: build

# Installs the packages named in $(1) that are missing (as root; otherwise says how).
define install_packages
	@missing=""; for p in $(1); do \
	  dpkg-query -W -f='$${Status}' $$p 2>/dev/null | grep -q 'install ok installed' || missing="$$missing $$p"; \
	done; \
	if [ -n "$$missing" ]; then \
	  if [ "$$(id -u)" = 0 ]; then \
	    echo "Installing:$$missing"; \
	    apt-get update -qq && DEBIAN_FRONTEND=noninteractive apt-get install -y -qq $$missing; \
	  else \
	    echo "Missing Debian packages:$$missing"; \
	    echo "Install them with: sudo apt-get install$$missing"; exit 1; \
	  fi; \
	fi
endef

deps:
	$(call install_packages,$(BUILD_PACKAGES))
deps-test:
	$(call install_packages,$(TEST_PACKAGES))
deps-bench:
	$(call install_packages,$(BENCH_PACKAGES))
deps-fuzz:
	$(call install_packages,$(FUZZ_PACKAGES))
deps-docs:
	$(call install_packages,$(DOCS_PACKAGES))
deps-package:
	$(call install_packages,$(PACKAGE_PACKAGES))

# `make build`, `make demo` and `make install` need no test framework.
$(BUILD)/build.ninja: | deps
	cmake -S . -B $(BUILD) $(CMAKE_FLAGS) -DZYRSTD_BUILD_TESTS=OFF

build: deps $(BUILD)/build.ninja
	cmake --build $(BUILD)

demo: build
	./$(BUILD)/zyrstd demo

install: build
	cmake --install $(BUILD) $(if $(PREFIX),--prefix $(PREFIX))

# The tests build in directories of their own, with the test framework switched on.
test-normal: deps-test
	cmake -S . -B $(BUILD)-test $(CMAKE_FLAGS) -DZYRSTD_BUILD_TESTS=ON -DZYRSTD_SANITIZE=
	cmake --build $(BUILD)-test
	cd $(BUILD)-test && ctest $(CTEST_FLAGS)

test-asan: deps-test
	cmake -S . -B $(ASAN_BUILD) $(CMAKE_FLAGS) -DZYRSTD_SANITIZE=address
	cmake --build $(ASAN_BUILD)
	cd $(ASAN_BUILD) && ASAN_OPTIONS=detect_leaks=1 UBSAN_OPTIONS=print_stacktrace=1 ctest $(CTEST_FLAGS)

# ThreadSanitizer runs the suites that start threads. Address-space randomisation of
# recent kernels is too wide for its shadow layout, so the tests run with it narrowed.
test-tsan: deps-test
	cmake -S . -B $(TSAN_BUILD) $(CMAKE_FLAGS) -DZYRSTD_SANITIZE=thread
	cmake --build $(TSAN_BUILD)
	cd $(TSAN_BUILD) && TSAN_OPTIONS="halt_on_error=1 second_deadlock_stack=1" \
	  setarch $$(uname -m) -R ctest $(CTEST_FLAGS) -L threads

# clang's thread-safety analysis over the library: a compile-only check of the lock
# annotations (no test runs in this build).
test-locks: deps-test
	CC=clang CXX=clang++ cmake -S . -B $(LOCKS_BUILD) -G Ninja -DCMAKE_BUILD_TYPE=Debug \
	  -DCMAKE_CXX_FLAGS=-g0 -DZYRSTD_BUILD_TESTS=OFF
	cmake --build $(LOCKS_BUILD) --target ZYRStd Kelvrin zyrstd_hostkit

test: test-normal test-asan test-tsan test-locks

bench: deps-bench
	cmake -S . -B $(BENCH_BUILD) -G Ninja -DCMAKE_BUILD_TYPE=Release -DZYRSTD_BUILD_TESTS=OFF -DZYRSTD_BUILD_BENCH=ON
	cmake --build $(BENCH_BUILD)
	@for b in $(BENCH_BUILD)/*Bench; do echo "== $$b"; $$b --benchmark_min_time=0.2 || exit 1; done

# Each libFuzzer target runs for FUZZ_SECONDS from its seed corpus (new finds go to a
# scratch corpus, so the tree only changes when someone copies a case in). A finding fails
# the target; its input is saved in the build directory and the whole run in <name>.log.
fuzz: deps-fuzz
	CC=clang CXX=clang++ cmake -S . -B $(FUZZ_BUILD) -G Ninja -DCMAKE_BUILD_TYPE=RelWithDebInfo \
	  -DZYRSTD_SANITIZE=address -DZYRSTD_BUILD_TESTS=OFF -DZYRSTD_BUILD_FUZZ=ON
	cmake --build $(FUZZ_BUILD)
	@for f in fuzz/*Fuzz.cpp; do \
	  name=$$(basename $$f .cpp); scratch=$(FUZZ_BUILD)/corpus/$$name; mkdir -p $$scratch; \
	  log=$(FUZZ_BUILD)/$$name.log; \
	  echo "== $$name ($(FUZZ_SECONDS) s)"; \
	  ASAN_OPTIONS=detect_leaks=1 ./$(FUZZ_BUILD)/$$name -max_total_time=$(FUZZ_SECONDS) \
	    -print_final_stats=1 -artifact_prefix=$(FUZZ_BUILD)/$$name- \
	    $$scratch fuzz/corpus/$$name >$$log 2>&1; status=$$?; \
	  grep -E 'stat::number_of_executed_units|ERROR|SUMMARY|Done' $$log; \
	  if [ $$status -ne 0 ]; then echo "$$name failed (exit $$status): see $$log"; exit 1; fi; \
	done

soak: deps-test
	cmake -S . -B $(BUILD)-test $(CMAKE_FLAGS) -DZYRSTD_BUILD_TESTS=ON -DZYRSTD_SANITIZE=
	cmake --build $(BUILD)-test --target ZYRSoak
	ZYRSTD_SOAK_SECONDS=$(SOAK_SECONDS) ./$(BUILD)-test/tests/ZYRSoak

# Debian packages of the runtime library with the tool, and of the development files.
package: deps-package
	cmake -S . -B $(PACKAGE_BUILD) -G Ninja -DCMAKE_BUILD_TYPE=Release -DZYRSTD_BUILD_TESTS=OFF \
	  -DZYRSTD_DOCS_DIR=$(CURDIR)/$(PACKAGE_BUILD)/docs
	cmake --build $(PACKAGE_BUILD)
	tests/install/docs_check.sh $(PACKAGE_BUILD) . --html $(PACKAGE_BUILD)/docs
	cmake -S . -B $(PACKAGE_BUILD) # the reference now exists: the -dev package takes it
	cd $(PACKAGE_BUILD) && cpack -G DEB
	@ls -1 $(PACKAGE_BUILD)/*.deb

# Installs the packages of `make package` with apt (as root), builds and runs the install
# test's consumer against them with pkg-config and with CMake, and removes them again.
package-check: package
	DEBIAN_FRONTEND=noninteractive apt-get install -y -qq ./$(PACKAGE_BUILD)/libzyrstd*.deb
	g++ -std=c++20 tests/install/consumer/app.cpp -o $(PACKAGE_BUILD)/app-deb \
	  $$(pkg-config --cflags --libs zyrstd-hostkit) && ./$(PACKAGE_BUILD)/app-deb
	cmake -S tests/install/consumer -B $(PACKAGE_BUILD)/consumer -G Ninja && \
	  cmake --build $(PACKAGE_BUILD)/consumer && ./$(PACKAGE_BUILD)/consumer/app
	zyrstd --help > /dev/null
	DEBIAN_FRONTEND=noninteractive apt-get remove -y -qq libzyrstd-dev libzyrstd0

# The HTML reference of the installed interface, README as its main page, into
# $(DOCS_BUILD)/html; an undocumented installed declaration fails it.
docs: deps-docs build
	tests/install/docs_check.sh $(BUILD) . --html $(DOCS_BUILD)

# Records the exported interface of a normal build as the new baseline: only for a deliberate
# change (an incompatible one also bumps the SONAME; see the README).
abi-baseline: deps-test
	cmake -S . -B $(BUILD)-test $(CMAKE_FLAGS) -DZYRSTD_BUILD_TESTS=ON -DZYRSTD_SANITIZE=
	cmake --build $(BUILD)-test
	tests/install/abi_test.sh $(BUILD)-test abi/libZYRStd.abi --write

format:
	clang-format -i $$(git ls-files '*.cpp' '*.h')

clean:
	rm -rf $(BUILD) $(BUILD)-test $(ASAN_BUILD) $(TSAN_BUILD) $(BENCH_BUILD) $(FUZZ_BUILD) $(PACKAGE_BUILD) $(LOCKS_BUILD) $(DOCS_BUILD)
