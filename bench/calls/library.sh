# What bench/hops and bench/instructions share: a library built in a way of its own from the sources
# of this work tree or of another one, and a host of it that is always this tree's.

# choose_source NAME [SOURCE]: sets `source` and `tree`, the folder that it is built in.
choose_source() {
  source=$PWD tree=$PWD/build/$1
  [ -n "${2:-}" ] || return 0
  [ -f "$2/CMakeLists.txt" ] || fail "$2 is no work tree"
  source=$(cd "$2" && pwd)
  tree=$PWD/build/$1-$(basename "$source")
}

# build_library [CMAKE OPTION...]
build_library() {
  step "configuring $tree" "build/log/${tree##*/}-configure.log" \
    cmake -S "$source" -B "$tree" -DCMAKE_CXX_COMPILER=g++ -DQLX_BUILD_TOOLS=OFF \
    -DQLX_BUILD_EXAMPLES=OFF -DQLX_BUILD_TESTS=OFF -DQLX_BUILD_BENCH=OFF "$@"
  step "building $tree" "build/log/${tree##*/}-build.log" \
    cmake --build "$tree" --parallel "$jobs" --target qlx
}

# build_host NAME SOURCE... [OPTION...]
build_host() {
  local name=$1
  shift
  step "building $name" "build/log/$name.log" \
    g++ -std=c++20 -O2 -g -Wall -Wextra -I"$source/include" "$@" -o "$tree/$name" \
    -L"$tree/src" -Wl,-rpath,"$tree/src" -lqlx
}
