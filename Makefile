# The two commands of the README (make run, make test) and the developer's other targets.
# Every target first installs the Debian packages the build needs when they are missing.

JOBS      ?= $(shell nproc)
CTEST_JOBS ?= $(shell echo $$(( $(JOBS) * 2 )))
CMAKE_FLAGS ?=

DEBIAN_PACKAGES := cmake g++ make pkg-config libgtest-dev libgmock-dev libbenchmark-dev \
                   nlohmann-json3-dev libhdf5-dev hdf5-tools clang clang-format libclang-rt-14-dev python3 python3-can tmux

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

# The drive directory of the controller and the port its configuration file names (13456
# without a file or a usable first word).
DRIVE_C ?= $(or $(KELVANERT_DRIVE_C),$(HOME)/.kelvanert/drive_c)
SERVICE_DIR = $(DRIVE_C)/QV-RT/tarvix/kelvane
# Where the controller looks for the measurement-data library of type 2 logs by default.
VORA_DLL = $(DRIVE_C)/Program Files/Quovera/Shared/vora/vora.dll

run: build
	@mkdir -p "$(SERVICE_DIR)"
	@install -D -m 755 build/vora/vora.dll "$(VORA_DLL)" && echo "kelvanert: measurement-data library $(VORA_DLL)"
	@port=$$(awk 'BEGIN { p = 13456 } { for (i = 1; i <= NF; i++) { t = $$i; \
	    if (length(t) <= 19 && index(t, "=") > 0) p = (substr(t, index(t, "=") + 1) + 0) % 65536; \
	    exit } } END { print p }' "$(SERVICE_DIR)/kelvanert.ini" 2>/dev/null || echo 13456); \
	  echo "kelvanert: service directory $(SERVICE_DIR)"; \
	  echo "kelvanert: port $$port (listening 10 s after the start); Ctrl-C stops the controller"
	KELVANERT_DRIVE_C="$(DRIVE_C)" ./build/bin/kelvanert-controller

# The dispatcher's fuzz target for FUZZ_SECONDS (default 5 minutes), clang with libFuzzer.
FUZZ_SECONDS ?= 300

fuzz: deps
	cmake -S fuzz -B build-fuzz -DCMAKE_BUILD_TYPE=Debug -DCMAKE_C_COMPILER=clang -DCMAKE_CXX_COMPILER=clang++ $(CMAKE_FLAGS)
	cmake --build build-fuzz -j $(JOBS) --target dispatcher_fuzz
	mkdir -p build-fuzz/corpus
	ASAN_OPTIONS=detect_leaks=1 ./build-fuzz/dispatcher_fuzz -max_total_time=$(FUZZ_SECONDS) \
	  -max_len=1024 -timeout=10 build-fuzz/corpus fuzz/corpus

clean:
	rm -rf build build-asan build-tsan build-bench build-fuzz
