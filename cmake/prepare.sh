# Shared by run.sh and test.sh: installs what is missing and builds. Everything it has to say goes
# to standard error, so that the standard output of run.sh is the result of the query alone.

top=$(cd "$(dirname "${BASH_SOURCE[0]}")/.." && pwd)
jobs=$(nproc 2>/dev/null || echo 2)

# as_root COMMAND...
as_root() {
  if [ "$(id -u)" -eq 0 ]; then "$@"; else sudo "$@"; fi
}

# need_packages PACKAGE...: asks for the network only when one is really missing.
need_packages() {
  local missing=() package
  for package in "$@"; do
    [ "$(dpkg-query -W -f='${db:Status-Status}' "$package" 2>/dev/null)" = installed ] ||
      missing+=("$package")
  done
  [ ${#missing[@]} -eq 0 ] && return 0
  echo "Installing: ${missing[*]}" >&2
  as_root apt-get update -qq >&2 &&
    as_root env DEBIAN_FRONTEND=noninteractive \
      apt-get install -y -qq --no-install-recommends "${missing[@]}" >&2
}

# quietly COMMAND...: shows the output only when the command fails.
quietly() {
  local log status=0
  log=$(mktemp)
  # A failure must not end a shell that ends at failures before it is shown.
  "$@" >"$log" 2>&1 || status=$?
  [ $status -eq 0 ] || cat "$log" >&2
  rm -f "$log"
  return $status
}

# build PRESET [CMAKE_OPTION...] [-- TARGET...]
build() {
  local preset=$1 options=() targets=()
  shift
  while [ $# -gt 0 ] && [ "$1" != -- ]; do
    options+=("$1")
    shift
  done
  [ $# -gt 1 ] && shift && targets=(--target "$@")
  cd "$top" || return 1
  [ -f "build/$preset/xquery" ] || echo "Building build/$preset, which takes a few minutes" >&2
  if [ ${#options[@]} -gt 0 ] || [ ! -f "build/$preset/build.ninja" ]; then
    quietly cmake --preset "$preset" "${options[@]}" || return 1
  fi
  quietly cmake --build --preset "$preset" -j "$jobs" "${targets[@]}"
}

mapfile -t packages < <(grep -v '^#' "$top/cmake/debian-packages.txt")
