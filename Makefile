# The front door: a thin face over CMake. Every target builds below build/ and installs the Debian packages
# that it needs and does not find (tools/packages.sh).
#
#   make demo      build the library and the examples and run them on the recording that is shipped
#   make test      build everything and run the tests
#   make bench     time every intrinsic and write docs/performance.md
#   make docs      write build/docs/reference.html, all intrinsics on one page
#   make picture   take docs/pictures/reference.png of that page
#   make install   install library and headers (PREFIX=/usr/local, DESTDIR=)
#   make headers   write the public headers and docs/coverage.md anew from the tables of rows
#   make format    format the sources
#   make clean     remove build/

PREFIX ?= /usr/local
CMAKE_BUILD = cmake --build --parallel --preset

.PHONY: help demo test bench docs picture install headers format clean

help:
	@sed -n 's/^#   //p' Makefile

demo:
	tools/packages.sh build
	cmake --preset demo
	$(CMAKE_BUILD) demo
	tools/demo.sh build/demo

test:
	tools/packages.sh build test
	cmake --preset test
	$(CMAKE_BUILD) test
	ctest --preset test

bench:
	tools/packages.sh build test
	cmake --preset test
	$(CMAKE_BUILD) test
	tools/performance.py build/test docs/performance.md

docs:
	tools/packages.sh build
	cmake --preset docs
	$(CMAKE_BUILD) docs --target reference

picture: docs
	tools/packages.sh picture
	tools/reference/picture.py build/docs/reference.html docs/pictures/reference.png

install:
	tools/packages.sh build
	cmake --preset demo
	$(CMAKE_BUILD) demo
	DESTDIR=$(DESTDIR) cmake --install build/demo --prefix $(PREFIX)

headers:
	tools/packages.sh build
	tools/generate_headers.py
	tools/coverage.py

format:
	tools/packages.sh check
	tools/format.sh

clean:
	rm -rf build
