#!/usr/bin/env bash
# check_package.sh man PAGE...                          every page formats without a warning
# check_package.sh deb CPACK CONFIG VERSION HELP_SOURCE builds the .deb, unpacks it, runs it
set -euo pipefail

fail() {
  echo "FAIL: $*" >&2
  exit 1
}

# man-db hands -ww to groff: any troff warning (bad macro, unknown escape, a line that cannot
# be filled) comes out on standard error. lexgrog must find the NAME line that whatis and
# apropos read.
check_manpages() {
  local page warnings
  for page in "$@"; do
    [ -s "$page" ] || fail "$page missing or empty"
    warnings="$(LC_ALL=C.UTF-8 MANWIDTH=80 man --warnings -E UTF-8 -l "$page" 2>&1 >/dev/null)"
    [ -z "$warnings" ] || fail "$page: $warnings"
    lexgrog "$page" >/dev/null || fail "$page: lexgrog finds no NAME section"
    for section in NAME SYNOPSIS DESCRIPTION OPTIONS ENVIRONMENT FILES "EXIT STATUS" EXAMPLES; do
      zcat -f "$page" | grep -qx "\.SH \"\?$section\"\?" || fail "$page: no $section section"
    done
  done
}

check_deb() {
  local cpack="$1" config="$2" version="$3" help_source="$4"
  local arch deb depends root
  work="$(mktemp -d)"
  trap 'rm -rf "$work"' EXIT

  "$cpack" --config "$config" -G DEB -B "$work/out" >"$work/cpack.log" 2>&1 ||
    { cat "$work/cpack.log" >&2; fail "cpack"; }
  arch="$(dpkg --print-architecture)"
  deb="$work/out/lineprobe_${version}_${arch}.deb"
  [ -f "$deb" ] || fail "no lineprobe_${version}_${arch}.deb among: $(ls "$work/out")"

  # dpkg-shlibdeps read the binaries: the C library and the terminal library are named.
  depends="$(dpkg-deb -f "$deb" Depends)"
  for lib in libc6 libstdc++6 libncurses; do
    grep -q "$lib" <<<"$depends" || fail "Depends lacks $lib: $depends"
  done

  root="$work/root"
  dpkg-deb -x "$deb" "$root"
  local lineprobe vx7sim
  lineprobe="$(find "$root" -path '*/bin/lineprobe' -type f)"
  vx7sim="$(find "$root" -path '*/bin/vx7sim' -type f)"
  [ -n "$lineprobe" ] && [ -n "$vx7sim" ] || fail "programs missing: $(dpkg-deb -c "$deb")"
  local prefix="${lineprobe%/bin/lineprobe}"
  for program in "$lineprobe" "$vx7sim"; do
    file -b "$program" | grep -q ', stripped' || fail "$program not stripped: $(file -b "$program")"
  done

  local out
  out="$("$lineprobe" -v)" || fail "lineprobe -v ended with $?"
  [ "$out" = "lineprobe version 1.0" ] || fail "lineprobe -v printed: $out"
  out="$("$vx7sim" --help)" || fail "vx7sim --help ended with $?"
  [[ "$(head -n 1 <<<"$out")" == "usage: vx7sim [--farm FILE] [--port PORT] [--bind ADDRESS]"* ]] ||
    fail "vx7sim --help printed: $(head -n 3 <<<"$out")"

  # The relay decoder goes where Debian's Wireshark loads global Lua plugins by itself.
  find "$prefix/lib" -path '*/wireshark/plugins/vx7relay.lua' -type f | grep -q . ||
    fail "no vx7relay.lua under lib/*/wireshark/plugins: $(dpkg-deb -c "$deb")"

  local man1="$prefix/share/man/man1"
  check_manpages "$man1/lineprobe.1.gz" "$man1/vx7sim.1.gz"

  # The manual page tells the operator what CORVO_ORVANE_DIR to set and where the farms are:
  # both must be where the package put them.
  local orvane farms
  orvane="$(zcat "$man1/lineprobe.1.gz" | grep -o 'CORVO_ORVANE_DIR=[^ ]*' | head -n 1)"
  orvane="${orvane#CORVO_ORVANE_DIR=}"
  [ -n "$orvane" ] || fail "lineprobe.1 names no CORVO_ORVANE_DIR value"
  cmp "$root${orvane}bin/lineprobe_help.txt" "$help_source" ||
    fail "help text not at ${orvane}bin/lineprobe_help.txt"
  farms="$(zcat "$man1/lineprobe.1.gz" | grep -o '/[^ ]*/big33.toml' | head -n 1)"
  [ -n "$farms" ] || fail "lineprobe.1 names no farm path"
  # The packaged server plays the packaged farm: it listens, answers and ends on quit.
  out="$(echo quit | timeout 20 "$vx7sim" --farm "$root$farms" --port 0 --bind 127.0.0.1)" ||
    fail "vx7sim on $farms ended with $?: $out"
  grep -q '^listening on [0-9]' <<<"$out" || fail "vx7sim on $farms printed: $out"

  local doc="$prefix/share/doc/lineprobe"
  [ -s "$doc/copyright" ] || fail "no $doc/copyright"
  zcat "$doc/changelog.gz" | head -n 1 | grep -q "^lineprobe ($version) " ||
    fail "changelog.gz does not start with version $version"
}

mode="$1"
shift
case "$mode" in
  man) check_manpages "$@" ;;
  deb) check_deb "$@" ;;
  *) fail "unknown mode $mode" ;;
esac
echo "ok"
