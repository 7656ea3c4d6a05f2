# The two commands of the README (make run, make test) and the developer's other targets.
# Every target first installs the Debian packages the build needs when they are missing.

JOBS      ?= $(shell nproc)
CTEST_JOBS ?= $(shell echo $$(( $(JOBS) * 2 )))
CMAKE_FLAGS ?=

DEBIAN_PACKAGES := cmake g++ make pkg-config libgtest-dev libgmock-dev libbenchmark-dev \
                   nlohmann-json3-dev libhdf5-dev hdf5-tools clang libclang-rt-14-dev python3 python3-can tmux

SUDO := $(shell [ "$$(id -u)" = 0 ] || echo sudo)

.PHONY: all deps build test sanitize tsan run fuzz bench clean

all: build

deps:
	@missing=""; for p in $(DEBIAN_PACKAGES); do \
	  dpkg-query -W -f='$${Status}' $$p 2>/dev/null | grep -q "install ok installed" || missing="$$missing $$p"; \
	done; \
	if [ -n "$$missing" ]; then \
	  echo "Installing missing packages:$$missing"; \
	  $(SUDO) apt-get update -qq && DEBIAN_FRONTEND=noninteractive $(SUDO) apt-get install -y -qq $$missing; \
	fi

# build-DIR / cmake options / ctest for one flavour of the tree.
define flavour
	cmake -S . -B $(1) -DCMAKE_BUILD_TYPE=$(2) $(3) $(CMAKE_FLAGS)
	cmake --build $(1) -j $(JOBS)
endef

build: deps
	$(call flavour,build,RelWithDebInfo,)

test: build
	ctest --test-dir build -j $(CTEST_JOBS) --output-on-failure

sanitize: deps
	$(call flavour,build-asan,Debug,-DKELVANERT_SANITIZE=address)
	ASAN_OPTIONS=detect_leaks=1:abort_on_error=1 UBSAN_OPTIONS=print_stacktrace=1:halt_on_error=1 \
	  ctest --test-dir build-asan -j $(CTEST_JOBS) --output-on-failure

tsan: deps
	$(call flavour,build-tsan,RelWithDebInfo,-DKELVANERT_SANITIZE=thread)
	TSAN_OPTIONS=halt_on_error=1:second_deadlock_stack=1 \
	  ctest --test-dir build-tsan -j $(CTEST_JOBS) --output-on-failure

bench: deps
	$(call flavour,build-bench,Release,)
	@for b in build-bench/bench/*/bench_*; do [ -x "$$b" ] && echo "== $$b" && "$$b"; done; true

run: build
	@echo "The controller service is not built yet: 'make run' will start kelvanert-controller"
	@echo "on the simulated hardware once the service exists."

fuzz: deps
	@echo "No fuzz targets yet."

clean:
	rm -rf build build-asan build-tsan build-bench build-fuzz
