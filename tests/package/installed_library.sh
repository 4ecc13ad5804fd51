#!/usr/bin/env bash
# installed_library.sh SOURCE BUILD COMPILER FLAGS: installs the IPC library of a build into a folder of its own, builds
# the examples against it in every way there is, and runs them. FLAGS are those that the build's sanitizers need.
set -euo pipefail
source=$1 build=$2 compiler=$3 flags=$4
place=$(mktemp -d)
server=
trap 'kill $server 2>/dev/null || true; wait; rm -rf "$place"' EXIT
export XDG_RUNTIME_DIR=$place/runtime HOME=$place
mkdir -m 700 "$XDG_RUNTIME_DIR"

cmake --install "$build" --component KXIPC --prefix "$place/prefix" >"$place/install.log"
library=$(dirname "$(find "$place/prefix" -name libKXIPC.a)")
export PKG_CONFIG_PATH=$library/pkgconfig LD_LIBRARY_PATH=$library

# No header needs one that is not installed.
(cd "$place/prefix/include/kxipc" && find . -name '*.h' -printf '#include "%P"\n') >"$place/all.cpp"
"$compiler" -fsyntax-only $(pkg-config --cflags kxipc) "$place/all.cpp"

for kind in KXIPC KXIPC_static; do
    cmake -S "$source/examples/ipc" -B "$place/$kind" -G Ninja -D CMAKE_PREFIX_PATH="$place/prefix" \
        -D CMAKE_CXX_COMPILER="$compiler" -D CMAKE_CXX_FLAGS="$flags" -D GREETER_LIBRARY=KXIPC::$kind \
        -D CMAKE_DISABLE_FIND_PACKAGE_EXPAT="$([ $kind = KXIPC ] && echo ON || echo OFF)" >"$place/log"
    cmake --build "$place/$kind" >>"$place/log" || { cat "$place/log"; exit 1; }
done
"$compiler" $flags "$source/examples/ipc/client.cpp" $(pkg-config --cflags --libs kxipc) -o "$place/by-pkg-config"
# The tree can be moved; without the shared library, the linker takes the other.
cp -r "$place/prefix" "$place/moved"
find "$place/moved" -name '*.so*' -delete
PKG_CONFIG_PATH=${PKG_CONFIG_PATH/prefix/moved}
"$compiler" $flags "$source/examples/ipc/client.cpp" $(pkg-config --cflags --static --libs kxipc) -o "$place/static"
ldd "$place/KXIPC/greeter-client" | grep "$library/libKXIPC.so" >/dev/null # -q would leave while ldd writes
if ldd "$place/KXIPC_static/greeter-client" "$place/static" | grep libKXIPC; then exit 1; fi

"$place/KXIPC_static/greeter-server" >"$place/heard" &
server=$!
for client in "$place"/{KXIPC/greeter-client,KXIPC_static/greeter-client,by-pkg-config,static}; do
    [ "$(timeout 20 "$client" Ada)" = "Hello, Ada" ]
done
kill $server
wait $server
[ "$(grep -c '^Ada says hello$' "$place/heard")" -eq 4 ]
