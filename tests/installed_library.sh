#!/usr/bin/env bash
# Installs the build in the folder $1 for itself, builds the examples against it, and compares what
# they print and count on a sample device with what vespctl says.
set -euo pipefail
build=$1
source=$(cd "$(dirname "$0")/.." && pwd)
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
prefix=$work/prefix

cmake --install "$build" --prefix "$prefix" >/dev/null
library=$(find "$prefix" -name libvesprun.so)
export LD_LIBRARY_PATH=${library%/*} PKG_CONFIG_PATH=${library%/*}/pkgconfig

# The shared library shows what the public headers mark, under the version of its language, and
# nothing else. PropertyDict is marked as a whole.
shopt -s extglob
marked() {
  cat "$@" | grep -v '#define' | tr '\n' ' ' | grep -oP 'VESPRUN_EXPORT [^(;]*?\K[\w~]+(?=\(|;)'
}
{
  marked "$prefix"/include/vesprun/vesprun.h | sed 's/$/ VESPRUN_0.1/'
  marked "$prefix"/include/vesprun/!(vesprun|PropertyDict).h | sed 's/$/ VESPRUN_CXX_0.1/'
} | sort -u >"$work/marked"
nm -DC --defined-only "$library" | grep -v ' A VESPRUN' | cut -d' ' -f3- |
  grep -v '^vesprun::\(PropertyDict::\|operator==(\)' |
  sed -E 's/(\(.*|\[.*)@/@/; s/.*:://; s/@+/ /' |
  sort -u >"$work/visible"
diff "$work/marked" "$work/visible"

# A C++ program gets the values of the structured log, and is not ended for want of a device.
cat >"$work/values.cpp" <<'END'
#include <vesprun/vesprun.h>
#include <vesprun/vesprun.hpp>
#include <iostream>
int main() {
  vesprun::SetForceCollection(true);
  std::cout << vesprun::CurrentUserWriteAmplification() + vesprun::CurrentSystemWriteAmplification() +
                   (vesprun::NeedsValidityList() ? 1 : 0);
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
# The C header needs nothing of the compiler.
# shellcheck disable=SC2046
cc -std=c99 -Wall -Wextra -Wpedantic -Werror "$source/examples/count-lines/main.c" \
  $(pkg-config --cflags --libs vesprun) -o count-lines
# shellcheck disable=SC2046
cc -Wall -Wextra -Werror "$source/examples/time-command/main.c" \
  $(pkg-config --cflags --libs vesprun) -o time-command
# shellcheck disable=SC2046
c++ -std=c++20 "$source/examples/measure-disk/main.cpp" \
  $(pkg-config --cflags --libs vesprun) -o measure-disk

"$prefix/bin/vespctl" init "$work/device" --sample
"$prefix/bin/vespctl" -C "$work/device" nand lab --json >"$work/lab"
grep -oP '"com\.quill[^"]*":-?\d+' "$work/lab" | tr -d '"' |
  sed 's/:\(-\?[0-9]*\)$/: \1/' >"$work/expected"
[ "$(wc -l <"$work/expected")" -ge 5 ]
for program in shared/print-health static/print-health ./print-health; do
  "$program" "$work/device" | grep '^com\.quill' | diff "$work/expected" -
  if "$program" "$work/nowhere" 2>"$work/message"; then exit 1; fi
  grep -q "nowhere" "$work/message"
done

# Eight programs count at once, and one more is killed before its checkpoint.
{ seq 1000; sleep 1; } | ./count-lines "$work/device" example &
killed=$!
sleep 0.5
kill -KILL $killed
if wait $killed 2>/dev/null; then exit 1; fi
writers=()
for _ in 1 2 3 4 5 6 7 8; do
  seq 1000 | ./count-lines "$work/device" example | diff "$work/lab" - &
  writers+=($!)
done
for writer in "${writers[@]}"; do wait "$writer"; done
if ./count-lines "$work/nowhere" example 2>"$work/message"; then exit 1; fi
grep -q "nowhere" "$work/message"

# Two measure through the socket.
"$prefix/bin/vespctl" -C "$work/device" listen --socket "$work/socket" &
listener=$!
until [ -S "$work/socket" ]; do kill -0 $listener; sleep 0.1; done
./time-command "$work/socket" measured true
if ./time-command "$work/socket" measured false; then exit 1; fi
./measure-disk "$work/socket" measured.sync "$work"
kill $listener
wait $listener
if ./time-command "$work/socket" measured sh -c 'exit 3' 2>"$work/message"; then exit 1; fi
grep -q "socket" "$work/message"
"$prefix/bin/vespctl" -C "$work/device" counters dump | cut -f1,3,4 | grep -P '\tmeasured\.' |
  sed 's/^sample\t\(.*\)\t[0-9.e-]*$/sample \1/' | sort | uniq -c >"$work/measured"
sed 's/^ *//; s/\t/ /g' "$work/measured" | diff - <(cat <<'END'
2 sample measured.memoryKiB
2 sample measured.milliseconds
100 sample measured.sync
1 scalar measured.failures 1
1 scalar measured.runs 2
END
)

mkdir "$work/folder"
head -c 3000 /dev/zero >"$work/folder/big"
touch "$work/folder/empty"
python=$source/examples/watch-folder/watch_folder.py
"$python" "$work/device" "$work/folder" >"$work/ftl"
grep -q '^HLT_' "$work/ftl"
if "$python" "$work/nowhere" "$work/folder" 2>"$work/message"; then exit 1; fi
grep -q "^watch_folder.py: .*nowhere" "$work/message"

"$prefix/bin/vespctl" -C "$work/device" counters dump | cut -f1,3,4 | grep -P '\t(example|folder)\.' |
  sort | uniq -c | awk '{ print $1, $2, $3, $4 }' >"$work/counted"
diff - "$work/counted" <<'END'
72 sample example.length 1
720 sample example.length 2
7200 sample example.length 3
8 sample example.length 4
1 sample folder.fileBytes 0
1 sample folder.fileBytes 3000
1 scalar example.lines 8000
1 scalar folder.files 2
END
