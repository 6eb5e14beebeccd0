# What the scripts share: sourced by bash, which then stands in the root of the work tree.
# A step is silent when it succeeds; when it fails, the end of its output is shown and the last line
# says which step it was and where the whole output is.

set -euo pipefail
export LC_ALL=C.UTF-8
cd "$(dirname "${BASH_SOURCE[0]}")/.."
me=scripts/$(basename "$0")
jobs=$(nproc)

# To build and run everything: compiler, build tools, ICU (with genrb), and what the command, the
# tests and the benchmarks are made with.
build_packages=(g++ cmake ninja-build pkg-config libicu-dev icu-devtools libcli11-dev
                libgtest-dev libbenchmark-dev)
# What .ci/run needs beyond that.
check_packages=(clang libclang-rt-14-dev llvm clang-format clang-tidy python3)

fail() {
  echo "$me: $*" >&2
  exit 1
}

# step "what it does" LOG COMMAND...: runs the command with its output in the log.
step() {
  local what=$1 log=$2
  shift 2
  mkdir -p "$(dirname "$log")"
  if ! "$@" >"$log" 2>&1 </dev/null; then
    grep -vE '^\[[0-9]+/[0-9]+\] ' "$log" | tail -n 20 >&2   # without ninja's steps
    fail "$what failed (all of its output: $log)"
  fi
}

is_installed() {
  [ "$(dpkg-query -W -f='${db:Status-Status}' "$1" 2>/dev/null)" = installed ]
}

# install_packages NAME...: installs what is missing; without anything missing it asks nobody.
install_packages() {
  local missing=() root=() name
  if ! command -v dpkg-query >/dev/null; then
    fail "this is no Debian system: install the counterparts of '$*' and build with cmake"
  fi
  for name in "$@"; do
    is_installed "$name" || missing+=("$name")
  done
  [ ${#missing[@]} -gt 0 ] || return 0

  if [ "$(id -u)" != 0 ]; then
    command -v sudo >/dev/null || fail "missing packages (${missing[*]}), and neither root nor sudo"
    root=(sudo)
  fi
  echo "$me: installing ${missing[*]}"
  root+=(env DEBIAN_FRONTEND=noninteractive)
  step "apt-get update" build/log/apt-update.log "${root[@]}" apt-get update
  step "installing ${missing[*]}" build/log/apt-install.log \
    "${root[@]}" apt-get install -y --no-install-recommends "${missing[@]}"
}

# configure PRESET [CMAKE OPTION...]: configures build/PRESET, with Ninja when it is there.
configure() {
  local preset=$1 generator=()
  shift
  if [ ! -e "build/$preset/CMakeCache.txt" ] && command -v ninja >/dev/null; then
    generator=(-G Ninja)
  fi
  step "configuring build/$preset" "build/log/$preset-configure.log" \
    cmake --preset "$preset" "${generator[@]}" "$@"
}

# build PRESET [TARGET...]
build() {
  local preset=$1 targets=()
  shift
  [ $# -eq 0 ] || targets=(--target "$@")
  step "building build/$preset" "build/log/$preset-build.log" \
    cmake --build "build/$preset" --parallel "$jobs" "${targets[@]}"
}

# run_tests PRESET [CTEST OPTION...]: all tests, or those that the options choose. Without a test to
# run it fails.
run_tests() {
  local preset=$1 log=build/log/$1-test.log status=0
  shift
  ctest --test-dir "build/$preset" --parallel "$jobs" --output-on-failure --no-tests=error \
    "$@" >"$log" 2>&1 </dev/null || status=$?
  if [ $status != 0 ]; then
    grep -vE '^ *(Start +[0-9]+:|[0-9]+/[0-9]+ Test +#.* Passed )' "$log" | tail -n 200 >&2
    fail "tests failed in build/$preset (all of their output: $log)"
  fi
  grep -E '^[0-9]+% tests passed|^Total Test time' "$log"
}
