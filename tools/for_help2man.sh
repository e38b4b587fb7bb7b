#!/bin/sh
# $PROGRAM with the given options, its help as help2man knows the parts of one.
"$PROGRAM" "$@" | sed 's/^usage:/Usage:/; s/^options:/Options:/'
