#!/bin/bash
# One include compiled with the include path a subsystem builds with:
#   LayeringCheck.sh <compiler> <include folders, ':' between> <header> sees|blind
# "sees": the header must be found; "blind": it must not be (anything else failing fails the check).
IFS=: read -ra folders <<< "$2"
out=$(printf '#include "%s"\n' "$3" | "$1" -std=c++20 -E -x c++ "${folders[@]/#/-I}" - 2>&1 >/dev/null); status=$?
case "$4" in
  sees) [ $status = 0 ] || { echo "$out"; exit 1; } ;;
  blind) grep -q "$3: No such file or directory" <<< "$out" || { echo "expected $3 to be out of sight: $out"; exit 1; } ;;
esac
