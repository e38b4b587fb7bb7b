# The front door: a thin face over CMake. Every target builds below build/ and installs the Debian packages
# that it needs and does not find (tools/packages.sh).
#
#   make demo          build the library and the examples, run them and write build/demo/index.html, before and after
#   make test          build everything and run the tests
#   make try           build for one target; test and time one intrinsic (NAME=ADDSNX16)
#   make mutants       plant faults in all rows and in some rules, and list those that no test finds (MUTANTS=40, SEED=1,
#                      ONLY= a regular expression of tables and sources)
#   make conform       run the programs of kastarri-conform in every form that this machine has: the same report from all
#   make fuzz          run random programs of intrinsics against every library (SECONDS=60, SEED=1, ALSO= other build
#                      directories with the target `sequences`)
#   make bench         time every intrinsic and write docs/performance.md, a summary, build/performance.md and
#                      bench/costs.csv, which kastarri-profile reads
#   make bench-kernels time whole kernels: scalar C, loops that compilers vectorise, calls, inlined
#   make docs          write build/docs/reference.html, all intrinsics on one page
#   make picture       take docs/pictures/reference.png of that page
#   make install       install libraries and headers (PREFIX=/usr/local, DESTDIR=, LIBDIR=lib or lib/x86_64-linux-gnu)
#   make uninstall     remove what `make install` installed last (DESTDIR=)
#   make package       make Debian packages in build/packages
#   make release       make all that a release consists of, in build/release: sources, archives and Debian packages of
#                      both widths, the reference page, the performance tables, checksums; install and try each
#   make wheel         make a wheel of the Python package, with the 64-bit library, in build/wheels
#   make headers       write the public headers, gdb's table of types, docs/coverage.md, docs/shapes.md and the README's
#                      counts from the tables
#   make format        format the sources
#   make clean         remove build/
#   ... BITS=64        make, test, install ... the same for 64-bit programs, in build/demo-64, build/test-64 and so on

BITS ?= 32
PREFIX ?= /usr/local
MUTANTS ?= 40
SEED ?= 1
SECONDS ?= 60
CMAKE_BUILD = cmake --build --parallel --preset

ifeq ($(BITS),32)
WIDTH =
MULTIARCH = i386-linux-gnu
LIBDIR ?= lib
SUMMARY = docs/performance.md
COSTS = bench/costs.csv
else ifeq ($(BITS),64)
WIDTH = -64
MULTIARCH = x86_64-linux-gnu
LIBDIR ?= lib/$(MULTIARCH)
SUMMARY = docs/performance-64.md
COSTS = build/costs-64.csv
else
$(error BITS is $(BITS); known are 32 and 64)
endif

.PHONY: help demo test try mutants conform fuzz bench bench-kernels docs picture install uninstall package wheel release headers format clean

help:
	@sed -n 's/^#   //p' Makefile

demo:
	tools/packages.sh build demo
	cmake --preset demo$(WIDTH)
	$(CMAKE_BUILD) demo$(WIDTH)
	tools/demo/run.py build/demo$(WIDTH)

test:
	tools/packages.sh build test$(WIDTH)
	cmake --preset test$(WIDTH)
	$(CMAKE_BUILD) test$(WIDTH)
	ctest --preset test$(WIDTH)

try:
	tools/packages.sh build test
	tools/try.py $(NAME)

mutants:
	tools/packages.sh build test
	cmake --preset mutants
	$(CMAKE_BUILD) mutants --target kastarri_tests
	tools/mutants/mutants.py build/mutants --rules $(MUTANTS) --seed $(SEED) --only '$(ONLY)'

fuzz:
	tools/packages.sh build test$(WIDTH)
	cmake --preset test$(WIDTH)
	$(CMAKE_BUILD) test$(WIDTH) --target sequences
	tools/fuzz/fuzz.py build/test$(WIDTH) $(ALSO) --seconds $(SECONDS) --seed $(SEED)

conform:
	tools/packages.sh build test test-64
	for preset in test test-64 clang clang-64; do \
	  cmake --preset $$preset && $(CMAKE_BUILD) $$preset --target only_sse2 only_avx2 only_avx512 kastarri_static kastarri-conform || exit; \
	done
	tools/conform/check.py $(addprefix build/,test test-64 clang clang-64)

bench:
	tools/packages.sh build test$(WIDTH)
	cmake --preset test$(WIDTH)
	$(CMAKE_BUILD) test$(WIDTH) --target all kernel_modules
	cmake --preset clang$(WIDTH) -DKASTARRI_BUILD_BENCH=ON
	$(CMAKE_BUILD) clang$(WIDTH) --target kernel_modules
	tools/performance.py build/test$(WIDTH) --clang build/clang$(WIDTH) --summary $(SUMMARY) --table build/performance$(WIDTH).md --costs $(COSTS)

bench-kernels:
	tools/packages.sh build test$(WIDTH)
	cmake --preset test$(WIDTH)
	$(CMAKE_BUILD) test$(WIDTH) --target kernel_modules kastarri_bench
	tools/kernels.py build/test$(WIDTH)

docs:
	tools/packages.sh build
	cmake --preset docs$(WIDTH)
	$(CMAKE_BUILD) docs$(WIDTH) --target reference

picture: docs
	tools/packages.sh picture
	tools/reference/picture.py build/docs$(WIDTH)/reference.html docs/pictures/reference.png

install:
	tools/packages.sh build install
	cmake --preset install$(WIDTH) -DCMAKE_INSTALL_LIBDIR=$(LIBDIR)
	$(CMAKE_BUILD) install$(WIDTH)
	DESTDIR=$(DESTDIR) cmake --install build/install$(WIDTH) --prefix $(PREFIX)

package:
	tools/packages.sh build install
	cmake --preset install$(WIDTH) -DCMAKE_INSTALL_LIBDIR=lib/$(MULTIARCH)
	$(CMAKE_BUILD) install$(WIDTH)
	cpack --config build/install$(WIDTH)/CPackConfig.cmake -B build/packages

uninstall:
	DESTDIR=$(DESTDIR) cmake -DBUILD=build/install$(WIDTH) "-DOTHERS=$(filter-out build/install$(WIDTH),build/install build/install-64)" \
	  -P cmake/uninstall.cmake

release:
	tools/packages.sh build install release
	tools/release.py

wheel:
	tools/packages.sh build python
	/usr/bin/python3 -m pip wheel --no-build-isolation --no-deps -w build/wheels python/

headers:
	tools/packages.sh build
	tools/generate_headers.py
	tools/coverage.py

format:
	tools/packages.sh check
	tools/format.sh

clean:
	rm -rf build
