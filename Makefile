# Two commands a newcomer needs: `make run` starts the demo game, `make test` runs the tests.
BUILD_DIR ?= build
BUILD_TYPE ?= RelWithDebInfo
CTEST_ARGS ?=
FUZZ_DIR ?= fuzz-build
FUZZ_SECONDS ?= 60
FUZZ_RSS_MB ?= 1024
FUZZ_TARGETS ?=
ASAN_DIR ?= build-asan
GAMES_DIR ?= games

.PHONY: all deps configure build test test-asan run bench fuzz clean package new-game play

all: build

deps:
	@tools/install-deps

configure: deps
	@cmake -S . -B $(BUILD_DIR) -G Ninja -DCMAKE_BUILD_TYPE=$(BUILD_TYPE) >/dev/null

build: configure
	@cmake --build $(BUILD_DIR)

test: build
	@cd $(BUILD_DIR) && ctest --output-on-failure -j2 $(CTEST_ARGS)

# The whole test suite built with AddressSanitizer and UBSan in its own folder; a finding
# ends the program, so the test that meets it fails.
test-asan: deps
	@cmake -S . -B $(ASAN_DIR) -G Ninja -DCMAKE_BUILD_TYPE=RelWithDebInfo -DOX_SANITIZE=ON -DOX_BUILD_BENCH=OFF >/dev/null
	@cmake --build $(ASAN_DIR)
	@cd $(ASAN_DIR) && ASAN_OPTIONS=detect_leaks=1:check_initialization_order=1 UBSAN_OPTIONS=print_stacktrace=1 \
		ctest --output-on-failure -j2 $(CTEST_ARGS)

run: build
	@if [ -x $(BUILD_DIR)/src/k17 ]; then \
		dir=$$(games/demo/stage-run.sh $(abspath $(BUILD_DIR))/tools $(abspath $(BUILD_DIR))/demo-run) && \
		cd "$$dir" && exec $(abspath $(BUILD_DIR))/src/k17; \
	else \
		echo "make run: the game executable k17 is not built yet (the application spine comes next)"; \
		exit 1; \
	fi

bench: build
	@for b in $(BUILD_DIR)/bench/bench_*; do [ -x "$$b" ] && "$$b"; done

# Builds every fuzz/fuzz_* target with clang and runs each (or those named in FUZZ_TARGETS) for
# FUZZ_SECONDS under an RSS limit; findings (crash-*, leak-*, timeout-*, oom-*) land in
# $(FUZZ_DIR)/findings. A target with a finding does not stop the others.
fuzz: deps
	@CC=clang CXX=clang++ cmake -S . -B $(FUZZ_DIR) -G Ninja -DCMAKE_BUILD_TYPE=RelWithDebInfo \
		-DOX_BUILD_FUZZ=ON -DOX_BUILD_TESTS=OFF -DOX_BUILD_BENCH=OFF >/dev/null
	@cmake --build $(FUZZ_DIR)
	@mkdir -p $(FUZZ_DIR)/findings
	@failed=""; \
	for f in $(if $(FUZZ_TARGETS),$(addprefix $(FUZZ_DIR)/fuzz/,$(FUZZ_TARGETS)),$(FUZZ_DIR)/fuzz/fuzz_*); do \
		name=$$(basename $$f); \
		[ -x "$$f" ] || { echo "fuzz: no target $$name"; failed="$$failed $$name"; continue; }; \
		mkdir -p $(FUZZ_DIR)/corpus/$$name; \
		seeds=""; [ -d fuzz/corpus/$$name ] && seeds=fuzz/corpus/$$name; \
		echo "fuzz: $$name for $(FUZZ_SECONDS) s"; \
		if "$$f" -max_total_time=$(FUZZ_SECONDS) -rss_limit_mb=$(FUZZ_RSS_MB) \
			-artifact_prefix=$(FUZZ_DIR)/findings/$$name- \
			$(FUZZ_DIR)/corpus/$$name $$seeds >$(FUZZ_DIR)/$$name.log 2>&1; then \
			grep -E "^#[0-9]+ +DONE|Done [0-9]+ runs" $(FUZZ_DIR)/$$name.log | tail -2; \
		else \
			tail -40 $(FUZZ_DIR)/$$name.log; failed="$$failed $$name"; \
		fi; \
	done; \
	if [ -n "$$failed" ]; then echo "fuzz: findings in$$failed (see $(FUZZ_DIR)/findings)"; exit 1; fi

# An installable Debian package of the engine, the tools and the demo: $(BUILD_DIR)/k17_*.deb.
package: configure
	@cmake --build $(BUILD_DIR) --target k17 oxpack oxdump oxmedia oxfont oxlint
	@cd $(BUILD_DIR) && cpack -G DEB

# A new game folder $(GAMES_DIR)/NAME made from games/template, its product named NAME.
new-game:
	@case "$(NAME)" in ""|*[!A-Za-z0-9_-]*) echo "make new-game NAME=...: a name of letters, digits, _ and -"; exit 2;; esac
	@if [ -e "$(GAMES_DIR)/$(NAME)" ]; then echo "make new-game: $(GAMES_DIR)/$(NAME) exists already"; exit 1; fi
	@mkdir -p "$(GAMES_DIR)"
	@cp -r games/template "$(GAMES_DIR)/$(NAME)"
	@sed -i 's/product="My Game"/product="$(NAME)"/' "$(GAMES_DIR)/$(NAME)/game.xml"
	@sed -i 's|>My Game<|>$(NAME)<|' "$(GAMES_DIR)/$(NAME)/properties/strings.xml"
	@echo "$(GAMES_DIR)/$(NAME): made from games/template; check it with $(BUILD_DIR)/tools/oxlint $(GAMES_DIR)/$(NAME)"

# Starts the game folder games/GAME (make play GAME=NAME) in $(BUILD_DIR)/play-GAME, which links its files.
play: build
	@[ -f "$(GAMES_DIR)/$(GAME)/game.xml" ] || { echo "make play GAME=NAME: no $(GAMES_DIR)/$(GAME)/game.xml"; exit 2; }
	@mkdir -p $(BUILD_DIR)/play-$(GAME) && for entry in $(abspath $(GAMES_DIR)/$(GAME))/*; do \
		ln -sfn "$$entry" $(BUILD_DIR)/play-$(GAME)/$$(basename "$$entry"); done
	@cd $(BUILD_DIR)/play-$(GAME) && exec $(abspath $(BUILD_DIR))/src/k17

clean:
	rm -rf $(BUILD_DIR) $(FUZZ_DIR) $(ASAN_DIR)
