#!/usr/bin/env bash
# A Windows binary of ours must run on a bare Windows: it may import system DLLs only (no MinGW
# runtime, no third-party DLL) besides our own kernel, and the kernel must export its entry points.
#   WindowsImports.sh <objdump> <binary> [<export>...]
set -euo pipefail
objdump=$1 binary=$2
shift 2
report=$("$objdump" -p "$binary")
system='^(torvane|kernel32|user32|gdi32|advapi32|shell32|ole32|oleaut32|winmm|opengl32|comdlg32|comctl32|ws2_32|wsock32|msvcrt|shlwapi|imm32|version|api-ms-win-[a-z0-9-]+)\.dll$'
status=0
imports=0
while read -r dll; do
  imports=$((imports + 1))
  if ! tr '[:upper:]' '[:lower:]' <<<"$dll" | grep -Eq "$system"; then
    echo "$binary imports $dll, which Windows does not provide"
    status=1
  fi
done < <(sed -n 's/^[[:space:]]*DLL Name: //p' <<<"$report")
# Every Windows binary imports something (kernel32 at least): none read means a report not understood.
[ "$imports" -gt 0 ] || { echo "$binary: no imports found in the report of $objdump"; status=1; }
exports=$(sed -n '/^\[Ordinal\/Name Pointer\] Table/,/^$/p' <<<"$report")
for name in "$@"; do
  if ! grep -Fq "$name" <<<"$exports"; then
    echo "$binary does not export $name"
    status=1
  fi
done
exit $status
