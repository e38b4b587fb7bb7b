# kastarri in Debian, for machines that are not x86 Linux or have no compiler of their own:
#
#   docker build -t kastarri .                        compilers, gdb, and the library for both widths below /usr/local
#   docker run --rm -it -v "$PWD:/work" kastarri      a shell in the directory of a kernel
#   docker build --target tools -t kastarri-tools .   what it takes to build, test and change the library
FROM --platform=linux/amd64 debian:bookworm AS tools
COPY tools/packages.sh /tmp/packages.sh
RUN /tmp/packages.sh build install release demo test test-64 check && rm -rf /var/lib/apt/lists/* /tmp/packages.sh

FROM tools AS kastarri
COPY . /usr/src/kastarri
RUN cd /usr/src/kastarri && make install && make install BITS=64 && rm -rf build && ldconfig && \
    echo 'add-auto-load-safe-path /usr/local/lib' >> /etc/gdb/gdbinit
WORKDIR /work
