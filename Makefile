# Set-up, build and test on a fresh Debian machine: `make test`, `make demo`.
BUILD      ?= build
ASAN_BUILD ?= build/asan
JOBS       ?= 2
DEB_PACKAGES = cmake g++ clang lld make libgtest-dev libgmock-dev libbenchmark-dev \
               libpugixml-dev libxlsxwriter-dev libncurses-dev locales \
               python3-ezdxf python3-openpyxl libdxflib-dev libclang-rt-14-dev libedit-dev \
               tmux nano

.PHONY: deps build test fuzz demo bench format clean

# Installs what is missing when run as root; otherwise only says what is missing.
deps:
	@missing=""; for p in $(DEB_PACKAGES); do \
	  dpkg-query -W -f='$${Status}' $$p 2>/dev/null | grep -q "install ok installed" || missing="$$missing $$p"; \
	done; \
	if [ -n "$$missing" ]; then \
	  if [ "$$(id -u)" = 0 ]; then \
	    echo "Installation de :$$missing"; \
	    apt-get update -qq && DEBIAN_FRONTEND=noninteractive apt-get install -y -qq $$missing; \
	  else echo "Paquets manquants (à installer en root) :$$missing"; fi; \
	fi
	@# The terminal tests run velhost under a UTF-8 and a Latin-1 French locale.
	@if [ "$$(id -u)" = 0 ] && ! { locale -a 2>/dev/null | grep -qi '^fr_FR.utf-\?8$$' && \
	    locale -a 2>/dev/null | grep -qi '^fr_FR.iso-\?8859-\?1$$'; }; then \
	  sed -i -e 's/^# *fr_FR.UTF-8 UTF-8/fr_FR.UTF-8 UTF-8/' -e 's/^# *fr_FR ISO-8859-1/fr_FR ISO-8859-1/' \
	    /etc/locale.gen && locale-gen >/dev/null; \
	fi

build: deps
	cmake -S . -B $(BUILD) -DCMAKE_BUILD_TYPE=RelWithDebInfo
	cmake --build $(BUILD) -j$(JOBS)

test: deps
	cmake -S . -B $(ASAN_BUILD) -DCMAKE_BUILD_TYPE=Debug -DVEL_SANITIZE=ON
	cmake --build $(ASAN_BUILD) -j$(JOBS)
	cd $(ASAN_BUILD) && ctest --output-on-failure -j$(JOBS)
	$(MAKE) fuzz

# The fuzz and benchmark trees, named apart from the folders of the tree in $(BUILD).
FUZZ_BUILD ?= build/fuzz-tree
BENCH_BUILD ?= build/bench-tree

# A short bounded run of each reader's fuzz target (clang, libFuzzer) from its seeds.
FUZZ_SECONDS ?= 20
FUZZ_TARGETS = dxf_reader schedule_reader ini_reader registry_reader script_input project_record
FUZZ_SEEDS_dxf_reader = tests/data/dxf/fuzz tests/data/dxf
FUZZ_SEEDS_script_input = tests/data/fuzz/script_input tests/apps/scripts tests/module/scripts
fuzz: deps
	cmake -S . -B $(FUZZ_BUILD) -DCMAKE_BUILD_TYPE=RelWithDebInfo -DVEL_FUZZ=ON \
	  -DCMAKE_C_COMPILER=clang -DCMAKE_CXX_COMPILER=clang++
	cmake --build $(FUZZ_BUILD) -j$(JOBS) --target $(addprefix fuzz_,$(FUZZ_TARGETS))
	$(foreach t,$(FUZZ_TARGETS),mkdir -p $(FUZZ_BUILD)/corpus/$(t) && \
	  $(FUZZ_BUILD)/bin/fuzz_$(t) -max_total_time=$(FUZZ_SECONDS) -max_len=32768 -timeout=10 -rss_limit_mb=2048 \
	  $(FUZZ_BUILD)/corpus/$(t) $(or $(FUZZ_SEEDS_$(t)),tests/data/fuzz/$(t)) &&) true

# The example project end to end, on copies of its files in $(BUILD)/demo.
demo: build
	rm -rf $(BUILD)/demo && mkdir -p $(BUILD)/demo
	cp examples/projet_vrd.dxf examples/VelaBordereau.xml $(BUILD)/demo/
	cd $(BUILD)/demo && ../bin/velhost --modules ../modules --profile profil \
	  --script ../../examples/demo.scr projet_vrd.dxf
	@echo
	@echo "Résultats de la démonstration, dans $(BUILD)/demo :"
	@echo "  projet_vrd.dxf         le dessin, avec les quantités des réseaux EP et EU et ses devis"
	@echo "  VelaBordereau.xml      le bordereau des prix mis à jour (PVC 315 du réseau EP à 72,50 € HT)"
	@echo "  VelaBordereau.xml.bak  le bordereau tel qu'il était avant le dernier enregistrement"
	@echo "  Devis.xlsx, Devis.csv      le devis de tout le projet, une ligne par projet"
	@echo "  Devis 2.xlsx, Devis 2.csv  le devis du seul réseau EU, quantités sommées"

bench: deps
	cmake -S . -B $(BENCH_BUILD) -DCMAKE_BUILD_TYPE=Release -DVEL_BENCH=ON
	cmake --build $(BENCH_BUILD) -j$(JOBS)
	@for b in $(BENCH_BUILD)/bin/bench_*; do [ -x "$$b" ] && "$$b"; done

# One style for all the C++ sources (.clang-format; Debian package clang-format).
format:
	git ls-files '*.cpp' '*.hpp' '*.h' | xargs clang-format -i

clean:
	rm -rf $(BUILD)
