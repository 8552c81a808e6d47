# Real time zone data for the commands in this folder: this machine's own, and data compiled from it with
# one rule changed. And the commands of the manual pages. To be sourced after common.sh.
# shellcheck shell=bash disable=SC2034,SC2154

machine_tree=/usr/share/zoneinfo
source_of_rules=$machine_tree/tzdata.zi
# The rule by which most of North America turns its clocks forward, and a later date for it: as the tz
# database has it, and as ICU does, whose months begin with 0.
rule='^R u 2007 ma - Mar Su>=8 2 1 D$'
changed_rule='R u 2007 ma - Mar Su>=22 2 1 D'
icu_rule='US:intvector { 2, 8, '
changed_icu_rule='US:intvector { 2, 22, '
# A moment between the two dates.
moment='2030-03-15 20:00 UTC'

# Prints what icuinfo says of $1.
icu_info() { icuinfo 2>/dev/null | sed -n "s/.*\"$1\">\(.*\)<.*/\1/p"; }

# Compiles the changed tz database into the tree $1, as release $2, by the commands of olmboot-image(7).
compile_tree() {
  local source=$TMPDIR/source commands
  grep -q "$rule" "$source_of_rules" || fail "the rule to be changed is not in $source_of_rules"
  mkdir -p "$source" "$1"
  ln -sfn "$1" "$source/tree"
  touch "$source/zonenow.tab" # Debian 12 has none
  cp "$machine_tree"/{*.tab,leap*} "$source"
  sed -i '/^#expires/d' "$source/leapseconds" # an older form, which zic(8) warns of
  sed "s/$rule/$changed_rule/; s/^# version .*/# version $2/" "$source_of_rules" >"$source/tzdata.zi"
  commands=$(example olmboot-image.7 'zic -b fat' | sed "/make/d; s/tree=.*/tree=tree/; s/2025b/$2/")
  (cd "$source" && eval "$commands")
}

# Compiles ICU's rules, changed in the same way, into the directory $1, as release $2. If there is $3, adds
# a data file of that format.
compile_icu() {
  local text=$TMPDIR/zoneinfo64.txt
  mkdir -p "$1"
  derb -c -s - zoneinfo64 | sed -e "s/$icu_rule/$changed_icu_rule/" \
    -e 's/^zoneinfo64{/zoneinfo64:table(nofallback){/' \
    -e "s/TZVersion { \".*\" }/TZVersion { \"$2\" }/" >"$text"
  grep -q "$changed_icu_rule" "$text" || fail "the rule to be changed is not in ICU's data"
  genrb -q -d "$1" "$text"
  [ $# -lt 3 ] || : >"$1/icutz$3.dat"
}

# example PAGE TEXT: prints the page's first example in which TEXT stands, as a terminal of 80 columns shows
# it.
example() {
  mandoc -T ascii -O width=80 "$project/man/$1.in" | sed 's/.\x08//g' |
    awk -v text="$2" -v RS= '/^           / && index($0, text) && !found++' | grep . ||
    fail "$1 has no example with '$2'"
}

# Does the example of olmboot-image(7) in which $2 stands, for the image $1.
in_image() {
  local commands
  commands=$(example olmboot-image.7 "$2")
  (export IMAGE=$1 && eval "$commands")
}
