#!/usr/bin/env bash
# What the shared library shows the loader: nine names, its soname, hardening, what it needs.
# Usage: library_test.sh LIBRARY MAP NM READELF
set -euo pipefail
library=$1 map=$2 nm=$3 readelf=$4
source "$(dirname "$0")/support/expect.sh"

dynamic=$("$readelf" --wide --dynamic "$library")
expect "exported names" \
    "$(grep -o 'zvckmservo_[A-Za-z]*' "$map" | sort | xargs)" \
    "$("$nm" --dynamic --defined-only "$library" | awk '{print $2 == "T" ? $3 : $2 ":" $3}' | sort | xargs)"
expect "their number" 9 "$("$nm" --dynamic --defined-only "$library" | wc -l)"
expect "soname" "[libdravik.so.1]" "$(awk '/\(SONAME\)/ {print $NF}' <<< "$dynamic")"
expect "text relocations" 0 "$(grep -c TEXTREL <<< "$dynamic" || true)"
expect "bound at load" 1 "$(grep -c '(FLAGS).*BIND_NOW' <<< "$dynamic" || true)"
expect "read-only relocations" 1 "$("$readelf" --wide --program-headers "$library" | grep -c GNU_RELRO || true)"
expect "run path" 0 "$(grep -cE 'RPATH|RUNPATH' <<< "$dynamic" || true)"
expect "needs nothing but" "" \
    "$(awk '/\(NEEDED\)/ {print $NF}' <<< "$dynamic" | grep -vE '^\[lib(stdc\+\+|gcc_s|c|cjson|boost_filesystem)\.so' | xargs)"
exit $((failures > 0))
