# What the commands in this folder share. To be sourced first, as `. common.sh "$@"`.
# shellcheck shell=bash

export LC_ALL=C
project=$(cd "$(dirname "${BASH_SOURCE[0]}")/.." && pwd)
build=${OLMBOOT_BUILD:-$project/build}

# The comment at the top of a command is its help.
case ${1-} in
  -h | --help)
    sed -n '2,/^[^#]/s/^# \{0,1\}//p' "$0"
    exit
    ;;
esac

# What is named here is removed when the command ends, however it ends.
remove_at_end=()
trap '[ ${#remove_at_end[@]} = 0 ] || rm -rf "${remove_at_end[@]}"' EXIT
trap 'exit 129' HUP
trap 'exit 130' INT
trap 'exit 143' TERM

fail() {
  printf '%s: %s\n' "$(basename "$0")" "$1" >&2
  exit 1
}

# Installs those of the given Debian packages that are missing; says so, or what to do where it
# can't. On another machine it says what is needed and goes on.
need_packages() {
  local package missing=() as_root=()
  if ! command -v dpkg-query >/dev/null || ! command -v apt-get >/dev/null; then
    echo "Not a Debian machine. This needs what Debian has in these packages: $*"
    return
  fi
  for package in "$@"; do
    # A line for each architecture.
    dpkg-query -W -f '${db:Status-Status}\n' "$package" 2>/dev/null | grep -qx installed ||
      missing+=("$package")
  done
  [ ${#missing[@]} -gt 0 ] || return 0
  if [ "$(id -u)" != 0 ]; then
    command -v sudo >/dev/null || fail "not root; run as root: apt-get install ${missing[*]}"
    as_root=(sudo)
  fi
  echo "Installing what is missing: ${missing[*]}"
  if ! "${as_root[@]}" apt-get update -qq >&2 ||
    ! "${as_root[@]}" env DEBIAN_FRONTEND=noninteractive \
      apt-get install -y -qq --no-install-recommends "${missing[@]}" >/dev/null; then
    fail "that failed; run as root: apt-get install ${missing[*]}"
  fi
}

# Runs a command as root: of the machine, or of a user namespace.
as_root() {
  local PATH=$PATH:/usr/sbin:/sbin
  if [ "$(id -u)" = 0 ]; then "$@"; else unshare --map-root-user "$@"; fi
}

# Ends the command where it could not enter a throw-away root.
need_root() {
  as_root chroot / true 2>/dev/null ||
    fail "this user can't enter a throw-away root; run as root, or allow user namespaces"
}

# Configures and builds the preset $1 in $build/$1, with further CMake options. Shows the output only
# when that fails, and warnings always. One command builds at a time.
build_preset() {
  local log status=0
  if ! { mkdir -p "$build" && touch "$build/lock"; } 2>/dev/null; then
    fail "$build can't be written; name another folder in OLMBOOT_BUILD"
  fi
  exec 9>"$build/lock"
  if ! flock -n 9; then
    echo "Another command is building; waiting for it."
    flock 9
  fi
  log=$(mktemp)
  remove_at_end+=("$log")
  (cd "$project" && cmake --preset "$1" -B "$build/$1" "${@:2}" &&
    cmake --build "$build/$1" -j "$(nproc)") >"$log" 2>&1 || status=$?
  if [ $status = 0 ]; then grep -A 3 'warning:' "$log" || true; else cat "$log" >&2; fi
  rm "$log"
  [ $status = 0 ] || fail "the build of preset '$1' failed"
  exec 9>&-
}

# Makes an empty throw-away root and names it in $root. It has a mark, which the benchmark looks for
# before it removes anything.
make_root() {
  root=$(mktemp -d)
  remove_at_end+=("$root")
  chmod 755 "$root"
  mkdir -p "$root/tmp" "$root/sbin" "$root/usr/share/icu" "$root/usr/share/zoneinfo.default" \
    "$root/var/db/timezone/tz"
  touch "$root/throw-away"
  install "$(type -P true)" "$root/tmp/true"
  "$root/tmp/true" 2>/dev/null ||
    fail "programs can't be run in ${TMPDIR:-/tmp} (noexec?); name another folder in TMPDIR"
}

# Puts the program $1 into the root as $2, with the libraries that it needs.
add_program() {
  install -D "$1" "$root$2"
  { ldd "$1" 2>/dev/null || true; } | { grep -o "/[^ ]*" || true; } | while read -r library; do
    [ -e "$root$library" ] || cp --parents -L "$library" "$root"
  done
}
