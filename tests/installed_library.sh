#!/usr/bin/env bash
# Installs the build in the folder $1 for itself, builds the example against each form of the library
# and compares what it prints of a sample device with what vespctl says.
set -euo pipefail
build=$1
source=$(cd "$(dirname "$0")/.." && pwd)
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
prefix=$work/prefix

cmake --install "$build" --prefix "$prefix" >/dev/null
library=$(find "$prefix" -name libvesprun.so)
export LD_LIBRARY_PATH=${library%/*} PKG_CONFIG_PATH=${library%/*}/pkgconfig

# The shared library shows what the public headers mark, and nothing else.
cat "$prefix"/include/vesprun/{*.h,NANDInfo/*.h} | grep -v '#define' | tr '\n' ' ' |
  grep -oP 'VESPRUN_EXPORT [^(;]*?\K[\w~]+(?=\(|;)' |
  sort -u >"$work/marked"
nm -DC --defined-only "$library" | cut -d' ' -f3- | sed 's/(.*//; s/\[.*//; s/.*:://' |
  sort -u >"$work/visible"
diff "$work/marked" "$work/visible"

# Another program sees the library's variables, and is not ended for want of a device.
cat >"$work/values.cpp" <<'END'
#include <vesprun/vesprun.h>
#include <iostream>
int main() {
  vesprun::gForceCollectionSet = 1;
  std::cout << vesprun::gCurrentUserWamp + vesprun::gCurrentSysWamp + vesprun::gNeedValidityList;
  vesprun::NandInfoExtractToEH_runAllSteps(0, true, 1, 0);
  std::cout << ' ' << vesprun::GetAPIErrorMessage() << '\n';
}
END
# shellcheck disable=SC2046
c++ -std=c++20 "$work/values.cpp" $(pkg-config --cflags --libs vesprun) -o "$work/values"
[ "$("$work/values")" = "0 NandInfoExtractToEH_runAllSteps: no device is open" ]

cp -r "$source/examples/print-health" "$work/example"
cd "$work/example"
sed 's/vesprun::vesprun)/vesprun::vesprun_static)/' CMakeLists.txt >"$work/static.txt"
cmake -S . -B shared -DCMAKE_PREFIX_PATH="$prefix" >/dev/null
cmake --build shared >/dev/null
mv "$work/static.txt" CMakeLists.txt
cmake -S . -B static -DCMAKE_PREFIX_PATH="$prefix" >/dev/null
cmake --build static >/dev/null
# shellcheck disable=SC2046
c++ -std=c++20 main.cpp $(pkg-config --cflags --libs vesprun) -o print-health

"$prefix/bin/vespctl" init "$work/device" --sample
"$prefix/bin/vespctl" nand "$work/device" lab | grep -oP '"com\.quill[^"]*":-?\d+' | tr -d '"' |
  sed 's/:\(-\?[0-9]*\)$/: \1/' >"$work/expected"
[ "$(wc -l <"$work/expected")" -ge 5 ]
for program in shared/print-health static/print-health ./print-health; do
  "$program" "$work/device" | grep '^com\.quill' | diff "$work/expected" -
  if "$program" "$work/nowhere" 2>"$work/message"; then exit 1; fi
  grep -q "nowhere" "$work/message"
done
