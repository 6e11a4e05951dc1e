#!/usr/bin/env bash
# Checks that Ulvetta.ax imports system DLLs only, exports exactly the four COM server entry points and
# carries its resources.
set -euo pipefail
dump=$(x86_64-w64-mingw32-objdump -p -h "$1")
imports=$(printf '%s\n' "$dump" | sed -n 's/^\s*DLL Name: //p' | tr 'A-Z' 'a-z' | sort -u | tr '\n' ' ')
foreign=$(printf '%s\n' $imports | grep -vxE '(advapi32|comdlg32|gdi32|kernel32|msvcrt|ole32|oleaut32|shell32|user32)\.dll' || true)
exports=$(printf '%s\n' "$dump" | sed -n '/\[Ordinal\/Name Pointer\] Table/,/^$/p' | grep -o 'Dll[A-Za-z]*' |
  sort | tr '\n' ' ' || true)
status=0
[ -z "$foreign" ] || { echo "Ulvetta.ax imports DLLs that are not system DLLs: $foreign"; status=1; }
[ "$exports" = "DllCanUnloadNow DllGetClassObject DllRegisterServer DllUnregisterServer " ] ||
  { echo "Ulvetta.ax exports '$exports'"; status=1; }
grep -q '\.rsrc' <<<"$dump" || { echo "Ulvetta.ax has no resource section"; status=1; }
[ $status -eq 0 ] && echo "imports: $imports; exports: $exports"
exit $status
