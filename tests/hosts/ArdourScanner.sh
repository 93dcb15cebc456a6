#!/bin/bash
# Ardour's VST 3 scanner on one bundle: ArdourScanner.sh <cache folder> <bundle> <plug-in name>.
# Exit 77 (skipped) without the scanner, or for a sanitized kernel it cannot load.
scanner=$(ls /usr/lib/ardour*/ardour-vst3-scanner 2>/dev/null | tail -n 1)
[ -n "$scanner" ] && ! ldd "$2"/Contents/*/libtorvane.so | grep -q libasan || exit 77
mkdir -p "$1"
out=$(LD_LIBRARY_PATH=${scanner%/*} XDG_CACHE_HOME="$1" "$scanner" -f "$2" 2>&1); status=$?
echo "$out"
[ $status = 0 ] && grep -q "Found Plugin: $3" <<< "$out" && ! grep -qi error <<< "$out"
