# Two commands a newcomer needs: `make run` starts the demo game, `make test` runs the tests.
BUILD_DIR ?= build
BUILD_TYPE ?= RelWithDebInfo
CTEST_ARGS ?=

.PHONY: all deps configure build test run bench fuzz clean

all: build

deps:
	@tools/install-deps

configure: deps
	@cmake -S . -B $(BUILD_DIR) -G Ninja -DCMAKE_BUILD_TYPE=$(BUILD_TYPE) >/dev/null

build: configure
	@cmake --build $(BUILD_DIR)

test: build
	@cd $(BUILD_DIR) && ctest --output-on-failure $(CTEST_ARGS)

run: build
	@if [ -x $(BUILD_DIR)/src/game/k17 ]; then \
		cd games/demo && exec ../../$(BUILD_DIR)/src/game/k17; \
	else \
		echo "make run: the game executable k17 is not built yet (the application spine comes next)"; \
		exit 1; \
	fi

bench: build
	@for b in $(BUILD_DIR)/bench/bench_*; do [ -x "$$b" ] && "$$b"; done

clean:
	rm -rf $(BUILD_DIR)
