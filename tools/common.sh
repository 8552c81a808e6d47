# What the commands in this folder share. To be sourced.
# shellcheck shell=bash

export LC_ALL=C
project=$(cd "$(dirname "${BASH_SOURCE[0]}")/.." && pwd)

fail() {
  printf '%s: %s\n' "$(basename "$0")" "$1" >&2
  exit 1
}

# Installs those of the given Debian packages that are missing; says so, or what to do where it
# can't.
need_packages() {
  local package missing=() as_root=()
  for package in dpkg-query apt-get; do
    command -v "$package" >/dev/null || fail "not a Debian machine; install by hand: $*"
  done
  for package in "$@"; do
    [ "$(dpkg-query -W -f '${db:Status-Status}' "$package" 2>/dev/null)" = installed ] ||
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

# Configures and builds the preset $1; shows the output only when that fails, and warnings always.
build_preset() {
  local log status=0
  log=$(mktemp)
  (cd "$project" && cmake --preset "$1" && cmake --build --preset "$1" -j "$(nproc)") \
    >"$log" 2>&1 || status=$?
  if [ $status = 0 ]; then grep -A 3 'warning:' "$log" || true; else cat "$log" >&2; fi
  rm -f "$log"
  [ $status = 0 ] || fail "the build of preset '$1' failed"
}

# Makes an empty throw-away root, names it in $root, and removes it when the script ends. What works
# in it looks for the mark first.
make_root() {
  root=$(mktemp -d)
  chmod 755 "$root"
  trap 'rm -rf "$root"' EXIT
  trap 'exit 129' HUP
  trap 'exit 130' INT
  trap 'exit 143' TERM
  touch "$root/throw-away"
  mkdir -p "$root/tmp" "$root/usr/share/icu" "$root/usr/share/zoneinfo.default" \
    "$root/var/db/timezone/tz"
}

# Puts the program $1 into the root as $2, with the libraries that it needs.
add_program() {
  install -D "$1" "$root$2"
  { ldd "$1" 2>/dev/null || true; } | { grep -o "/[^ ]*" || true; } | while read -r library; do
    [ -e "$root$library" ] || cp --parents -L "$library" "$root"
  done
}

# Runs a command as user 0, who may enter the root: of the machine, or of a user namespace.
as_user_0() {
  local PATH=$PATH:/usr/sbin:/sbin
  if [ "$(id -u)" = 0 ]; then
    "$@"
  else
    unshare --map-root-user true 2>/dev/null ||
      fail "this user can't enter a throw-away root; run as root, or allow user namespaces"
    unshare --map-root-user "$@"
  fi
}
