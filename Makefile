# The two commands of the README (make run, make test) and the developer's other targets.
# Every target first installs the Debian packages the build needs when they are missing
# (user-mode-linux, can-utils and kmod: the SocketCAN tests and benchmark boot a kernel with CAN).

JOBS      ?= $(shell nproc)
CTEST_JOBS ?= $(shell echo $$(( $(JOBS) * 2 )))
CMAKE_FLAGS ?=

DEBIAN_PACKAGES := cmake g++ make pkg-config libgtest-dev libgmock-dev libbenchmark-dev \
                   nlohmann-json3-dev libhdf5-dev hdf5-tools clang clang-format libclang-rt-14-dev python3 python3-can tmux \
                   user-mode-linux can-utils kmod

SUDO := $(shell [ "$$(id -u)" = 0 ] || echo sudo)

.PHONY: all deps build build-run test sanitize tsan run fuzz bench clean

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

# The sanitizer runs (sanitize, fuzz). Leaks that belong to libraries outside the tree are
# suppressed frame by frame in fuzz/lsan.supp, which says why.
SANITIZER_ENV = LSAN_OPTIONS=suppressions=$(CURDIR)/fuzz/lsan.supp \
  UBSAN_OPTIONS=print_stacktrace=1:halt_on_error=1

build: deps
	$(call flavour,build,RelWithDebInfo,)

# What `make run` needs: the module and the controller, the simulated driver, the measurement-data
# library and the host tools; the test programs are left to `make test`.
RUN_TARGETS := kelvanert kelvanert-controller tarvix vora kvmon kvlog voradump

build-run: deps
	cmake -S . -B build -DCMAKE_BUILD_TYPE=RelWithDebInfo $(CMAKE_FLAGS)
	cmake --build build -j $(JOBS) --target $(RUN_TARGETS)

test: build
	ctest --test-dir build -j $(CTEST_JOBS) --output-on-failure

sanitize: deps
	$(call flavour,build-asan,Debug,-DKELVANERT_SANITIZE=address)
	$(SANITIZER_ENV) ASAN_OPTIONS=detect_leaks=1:abort_on_error=1 ctest --test-dir build-asan -j $(CTEST_JOBS) --output-on-failure

tsan: deps
	$(call flavour,build-tsan,RelWithDebInfo,-DKELVANERT_SANITIZE=thread)
	TSAN_OPTIONS=halt_on_error=1:second_deadlock_stack=1 \
	  ctest --test-dir build-tsan -j $(CTEST_JOBS) --output-on-failure

bench: deps
	$(call flavour,build-bench,Release,)
	@for b in build-bench/bench/*/bench_*; do [ -x "$$b" ] && echo "== $$b" && "$$b"; done; true

# The drive directory of the controller and the port its configuration file names (13456
# without a file or a usable first word).
DRIVE_C ?= $(or $(KELVANERT_DRIVE_C),$(HOME)/.kelvanert/drive_c)
SERVICE_DIR = $(DRIVE_C)/QV-RT/tarvix/kelvane
# Where the controller looks for the measurement-data library of type 2 logs by default.
VORA_DLL = $(DRIVE_C)/Program Files/Quovera/Shared/vora/vora.dll

run: build-run
	@mkdir -p "$(SERVICE_DIR)"
	@install -D -m 755 build/vora/vora.dll "$(VORA_DLL)" && echo "kelvanert: measurement-data library $(VORA_DLL)"
	@echo "kelvanert: service directory $(SERVICE_DIR)"
	@echo "kelvanert: the service names its port when it listens, 10 s after the start; Ctrl-C stops the controller"
	KELVANERT_DRIVE_C="$(DRIVE_C)" ./build/bin/kelvanert-controller

# Every fuzz target (one per reader of outside input, fuzz/FuzzTargets.cmake) for FUZZ_SECONDS each
# (default 3 minutes), built with clang and libFuzzer, from the seed and regression inputs in
# fuzz/corpus/NAME; new inputs collect in build-fuzz/corpus/NAME. The first crash, sanitizer report
# or hang stops the run and fails it; its input is left in build-fuzz/crashes/. FUZZ_TARGETS picks
# some targets: make fuzz FUZZ_TARGETS=binary_log FUZZ_SECONDS=600. The measurement-data target
# runs with the slow unwinder, since libhdf5 has no frame pointers and only that unwinder sees the
# library frames lsan.supp names; and an allocation over 1 GiB returns null there, as one the
# system cannot serve does outside the sanitizer: libhdf5 asks for whatever size a damaged header
# states and handles the refusal itself (the sanitizer would otherwise fill gigabytes of shadow).
# Memory errors inside libhdf5 that the tree cannot fix are suppressed by frame in fuzz/asan.supp.
FUZZ_SECONDS ?= 180
FUZZ_TARGETS ?= dispatcher binary_log measurement_file hardware_config candump_replay configuration_file

fuzz: deps
	cmake -S fuzz -B build-fuzz -DCMAKE_BUILD_TYPE=Debug -DCMAKE_C_COMPILER=clang -DCMAKE_CXX_COMPILER=clang++ $(CMAKE_FLAGS)
	cmake --build build-fuzz -j $(JOBS) --target $(addsuffix _fuzz,$(FUZZ_TARGETS))
	@mkdir -p build-fuzz/crashes
	@for t in $(FUZZ_TARGETS); do \
	  case $$t in dispatcher) len=1024;; configuration_file) len=256;; *) len=0;; esac; \
	  hdf5=; [ $$t = measurement_file ] && hdf5=:fast_unwind_on_malloc=0:allocator_may_return_null=1:max_allocation_size_mb=1024:suppressions=$(CURDIR)/fuzz/asan.supp; \
	  mkdir -p build-fuzz/corpus/$$t; \
	  echo "== $$t: $(FUZZ_SECONDS) s"; \
	  $(SANITIZER_ENV) ASAN_OPTIONS=detect_leaks=1$$hdf5 ./build-fuzz/$${t}_fuzz -max_total_time=$(FUZZ_SECONDS) -max_len=$$len \
	    -timeout=10 -rss_limit_mb=2048 -print_final_stats=1 -artifact_prefix=build-fuzz/crashes/$$t- \
	    build-fuzz/corpus/$$t fuzz/corpus/$$t || exit 1; \
	done

clean:
	rm -rf build build-asan build-tsan build-bench build-fuzz
