#!/usr/bin/env bash
# Checks the import and export tables of Ulvetta.ax (system DLLs only, the four COM server exports) and that
# it carries its resources.
set -euo pipefail
module="$1"
dump=$(x86_64-w64-mingw32-objdump -p "$module")
imports=$(printf '%s\n' "$dump" | sed -n 's/^\s*DLL Name: //p' | tr 'A-Z' 'a-z' | sort -u)
allowed="advapi32.dll gdi32.dll kernel32.dll msvcrt.dll ole32.dll oleaut32.dll user32.dll"
status=0
for dll in $imports; do
  case " $allowed " in
    *" $dll "*) ;;
    *) echo "Ulvetta.ax imports $dll, which is not a system DLL"; status=1 ;;
  esac
done
exports=$(printf '%s\n' "$dump" | sed -n '/\[Ordinal\/Name Pointer\] Table/,/^$/p' | grep -o 'Dll[A-Za-z]*' | sort | tr '\n' ' ')
expected="DllCanUnloadNow DllGetClassObject DllRegisterServer DllUnregisterServer "
if [ "$exports" != "$expected" ]; then
  echo "Ulvetta.ax exports '$exports', expected '$expected'"
  status=1
fi
if ! x86_64-w64-mingw32-objdump -h "$module" | grep -q '\.rsrc'; then
  echo "Ulvetta.ax has no resource section"
  status=1
fi
[ $status -eq 0 ] && echo "imports: $imports; exports: $exports"
exit $status
