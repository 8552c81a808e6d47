# What the commands of this project share. To be sourced first, with the command's arguments.
# shellcheck shell=bash

export LC_ALL=C
unset CDPATH
umask 022
project=$(dirname "$(dirname "$(readlink -f "${BASH_SOURCE[0]}")")")
build=$(realpath -m "${OLMBOOT_BUILD:-$project/build}")

red='' plain=''
if [ -t 1 ] && [ -t 2 ] && [ -z "${NO_COLOR-}" ] && [ "${TERM-dumb}" != dumb ]; then red=$'\e[31m' plain=$'\e[m'; fi

fail() {
  printf '%s: %s\n' "$red$(basename "$0")$plain" "$1" >&2
  exit 1
}

# Ends the command for arguments that it doesn't know.
refuse() {
  printf '%s: %s; --help tells more\n' "$(basename "$0")" "$1" >&2
  exit 2
}

# The comment at the top of a command is its help. The first line of it names the arguments.
usage=$(sed -n '2s/^# //p' "$0")
case ${1-} in
  -h | --help)
    sed -n '2,/^\([^#]\|$\)/s/^# \{0,1\}//p' "$0"
    exit
    ;;
esac
[ $# = 0 ] || [[ $usage == *' '* ]] || refuse "unknown argument '$1'"

# All that a command and what it starts leaves in the temporary directory goes when it ends, unless by
# SIGKILL.
given=${TMPDIR:-/tmp}
TMPDIR=$(mktemp -d) || fail "name another temporary directory in TMPDIR"
trap 'rm -rf "$TMPDIR"' EXIT
trap 'exit 130' HUP INT TERM
export TMPDIR
log=$TMPDIR/log # of what is quiet

# quietly WHAT COMMAND...: says WHAT, runs the command with its output in $log, and says how long it took.
# If it fails, shows the end of the output, without what went well, and ends this command.
quietly() {
  local start=$SECONDS
  printf '%s ... ' "$1"
  if ! "${@:2}" >"$log" 2>&1 </dev/null; then
    echo
    grep -vE '^(-- |\[ *[0-9]+%\] | +Start|.* Passed  |[0-9]+ warnings? .*generated)' "$log" | tail -n 40 >&2
    fail "this failed: $1"
  fi
  echo "$((SECONDS - start)) s"
}

# Installs those of the given Debian packages that are missing, or says what to do where it can't. On
# another machine it says what is needed and goes on.
need_packages() {
  local package missing=() as_root=()
  if ! command -v dpkg-query >/dev/null || ! command -v apt-get >/dev/null; then
    echo "Not a Debian machine. This needs what Debian has in these packages: $*"
    return
  fi
  for package in $(printf '%s\n' "$@" | sort -u); do
    # A line for each architecture.
    dpkg-query -W -f '${db:Status-Status}\n' "$package" 2>/dev/null | grep -qx installed ||
      missing+=("$package")
  done
  [ ${#missing[@]} -gt 0 ] || return 0
  if [ "$(id -u)" != 0 ]; then
    command -v sudo >/dev/null ||
      fail "packages are missing; run as root: apt-get update && apt-get install ${missing[*]}"
    as_root=(sudo)
  fi
  quietly "Installing ${missing[*]}" "${as_root[@]}" sh -c 'apt-get update -qq &&
    DEBIAN_FRONTEND=noninteractive apt-get install -y -qq --no-install-recommends "$@"' - "${missing[@]}"
}

# Runs a command as root: of the machine, or of a user namespace.
as_root() {
  local PATH=$PATH:/usr/sbin:/sbin
  if [ "$(id -u)" = 0 ]; then "$@"; else unshare --map-root-user "$@"; fi
}

# Ends the command where it could not enter a throw-away root.
need_root() {
  as_root chroot / true 2>/dev/null ||
    fail "this user can't enter a throw-away root; run as root, or outside of any chroot with user namespaces"
}

configure_and_build() {
  (cd "$project" && cmake --preset "$1" -B "$build/$1" && cmake --build "$build/$1" -j "$(nproc)")
}

# Configures and builds the preset $1 in $build/$1, without what was set there before. Shows warnings. One
# command builds at a time.
build_preset() {
  mkdir -p "$build" || fail "name another build folder in OLMBOOT_BUILD"
  exec 9>"$build/lock"
  flock 9
  # --fresh would build everything again, too.
  rm -f "$build/$1/CMakeCache.txt"
  quietly "Building preset '$1'" configure_and_build "$1"
  grep -A 3 'warning:' "$log" || true
  exec 9>&-
}

# Builds the Debian package for the architecture $1, or this machine's, in a copy of the checkout, and
# names it in $package. It doesn't run the tests.
build_package() {
  local architecture=${1:-$(dpkg --print-architecture)}
  local folder=$TMPDIR/$architecture
  mkdir -p "$folder/olmboot"
  tar c -C "$project" --exclude=./.git --exclude=./build . | tar x -C "$folder/olmboot"
  quietly "Building the package for $architecture" env --chdir="$folder/olmboot" \
    dpkg-buildpackage -us -uc -Pnocheck "-a$architecture"
  package=$(echo "$folder"/olmboot_*.deb)
}

# Makes an empty throw-away root and names it in $root. It has a mark, which the benchmark looks for
# before it removes anything.
make_root() {
  root=$TMPDIR/root
  mkdir -p "$root"/{tmp,sbin,usr/share/{icu,zoneinfo.default},var/db/timezone/tz}
  touch "$root/throw-away"
  install "$(type -P true)" "$root/tmp/true"
  "$root/tmp/true" 2>/dev/null ||
    fail "programs can't be run in $given (noexec?); name another temporary directory in TMPDIR"
}

# Puts the program $1 into the root as $2, with the libraries that it needs.
add_program() {
  install -D "$1" "$root$2"
  { ldd "$1" 2>/dev/null || true; } | { grep -o "/[^ ]*" || true; } | while read -r library; do
    [ -e "$root$library" ] || cp --parents -L "$library" "$root"
  done
}
