# Two commands do everything on a fresh Debian machine: `make demo` and `make test`.
PACKAGES := cmake ninja-build g++ pkg-config libicu-dev libboost-thread-dev \
            libboost-system-dev libboost-date-time-dev googletest libgtest-dev \
            libbenchmark-dev libssl-dev libinih-dev
BUILD      ?= build
ASAN_BUILD ?= build-asan
BENCH_BUILD ?= build-bench
CMAKE_FLAGS := -G Ninja -DCMAKE_BUILD_TYPE=RelWithDebInfo
CTEST_FLAGS := --output-on-failure -j2

.PHONY: all deps build demo test test-normal test-asan bench install clean format

all: build

deps:
	@missing=""; for p in $(PACKAGES); do \
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

$(BUILD)/build.ninja: | deps
	cmake -S . -B $(BUILD) $(CMAKE_FLAGS)

build: deps $(BUILD)/build.ninja
	cmake --build $(BUILD)

demo: build
	./$(BUILD)/zyrstd demo

test-normal: build
	cd $(BUILD) && ctest $(CTEST_FLAGS)

$(ASAN_BUILD)/build.ninja: | deps
	cmake -S . -B $(ASAN_BUILD) $(CMAKE_FLAGS) -DZYRSTD_SANITIZE=ON

test-asan: deps $(ASAN_BUILD)/build.ninja
	cmake --build $(ASAN_BUILD)
	cd $(ASAN_BUILD) && ASAN_OPTIONS=detect_leaks=1 UBSAN_OPTIONS=print_stacktrace=1 ctest $(CTEST_FLAGS)

test: test-normal test-asan

$(BENCH_BUILD)/build.ninja: | deps
	cmake -S . -B $(BENCH_BUILD) -G Ninja -DCMAKE_BUILD_TYPE=Release -DZYRSTD_BUILD_TESTS=OFF -DZYRSTD_BUILD_BENCH=ON

bench: deps $(BENCH_BUILD)/build.ninja
	cmake --build $(BENCH_BUILD)
	@for b in $(BENCH_BUILD)/*Bench; do echo "== $$b"; $$b --benchmark_min_time=0.2 || exit 1; done

install: build
	cmake --install $(BUILD) $(if $(PREFIX),--prefix $(PREFIX))

format:
	clang-format -i $$(git ls-files '*.cpp' '*.h')

clean:
	rm -rf $(BUILD) $(ASAN_BUILD) $(BENCH_BUILD)
