# Two commands a newcomer needs: `make run` starts the demo game, `make test` runs the tests.
BUILD_DIR ?= build
BUILD_TYPE ?= RelWithDebInfo
CTEST_ARGS ?=
FUZZ_DIR ?= fuzz-build
FUZZ_SECONDS ?= 60

.PHONY: all deps configure build test run bench fuzz clean

all: build

deps:
	@tools/install-deps

configure: deps
	@cmake -S . -B $(BUILD_DIR) -G Ninja -DCMAKE_BUILD_TYPE=$(BUILD_TYPE) >/dev/null

build: configure
	@cmake --build $(BUILD_DIR)

test: build
	@cd $(BUILD_DIR) && ctest --output-on-failure -j2 $(CTEST_ARGS)

run: build
	@if [ -x $(BUILD_DIR)/src/k17 ]; then \
		cd games/demo && exec ../../$(BUILD_DIR)/src/k17; \
	else \
		echo "make run: the game executable k17 is not built yet (the application spine comes next)"; \
		exit 1; \
	fi

bench: build
	@for b in $(BUILD_DIR)/bench/bench_*; do [ -x "$$b" ] && "$$b"; done

# Builds every fuzz/fuzz_* target with clang and runs each for FUZZ_SECONDS; findings
# (crash-*, leak-*, timeout-*) land in $(FUZZ_DIR)/findings.
fuzz: deps
	@CC=clang CXX=clang++ cmake -S . -B $(FUZZ_DIR) -G Ninja -DCMAKE_BUILD_TYPE=RelWithDebInfo \
		-DOX_BUILD_FUZZ=ON -DOX_BUILD_TESTS=OFF -DOX_BUILD_BENCH=OFF >/dev/null
	@cmake --build $(FUZZ_DIR)
	@mkdir -p $(FUZZ_DIR)/findings
	@for f in $(FUZZ_DIR)/fuzz/fuzz_*; do \
		[ -x "$$f" ] || continue; \
		name=$$(basename $$f); mkdir -p $(FUZZ_DIR)/corpus/$$name; \
		seeds=""; [ -d fuzz/corpus/$$name ] && seeds=fuzz/corpus/$$name; \
		echo "fuzz: $$name for $(FUZZ_SECONDS) s"; \
		if ! "$$f" -max_total_time=$(FUZZ_SECONDS) -artifact_prefix=$(FUZZ_DIR)/findings/$$name- \
			$(FUZZ_DIR)/corpus/$$name $$seeds >$(FUZZ_DIR)/$$name.log 2>&1; then \
			tail -40 $(FUZZ_DIR)/$$name.log; exit 1; \
		fi; \
		grep -E "^#[0-9]+ +DONE|Done [0-9]+ runs" $(FUZZ_DIR)/$$name.log | tail -2; \
	done

clean:
	rm -rf $(BUILD_DIR) $(FUZZ_DIR)
