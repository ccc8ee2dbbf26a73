# Sourced by the testing/check-* scripts: checks one at a time, quiet when
# they hold, and the closing "N passed, N failed" line; the checkout,
# $source_dir (unless the script named it); and the script's scratch folder
# $work, removed at its end unless VELL_KEEP is set.
source_dir=${source_dir:-$(cd "$(dirname "${BASH_SOURCE[0]}")/.." && pwd)}
work=$(mktemp -d "/tmp/vell-$(basename "$0").XXXXXX") || exit 1
trap '[ -n "${VELL_KEEP:-}" ] || rm -rf "$work"' EXIT
passed=0 failed=0
check() {  # check NAME COMMAND...: one check; on failure, the last of what it printed
  local name=$1 output
  shift
  if output=$("$@" 2>&1); then passed=$((passed + 1)); else
    failed=$((failed + 1)); echo "FAILED: $name"; echo "$output" | tail -20 | sed 's/^/  /'; fi
}
summary() { echo "$passed passed, $failed failed"; [ "$failed" -eq 0 ]; }
# What stops the checks short counts as one failed.
die() { echo "$(basename "$0"): $*" >&2; echo "$passed passed, $((failed + 1)) failed"; exit 1; }

# COMMAND ends with STATUS and says TEXT; if not, the command to run by hand.
said() {  # said STATUS TEXT COMMAND...
  local want=$1 text=$2 out status
  shift 2
  out=$("$@" 2>&1)
  status=$?
  [ $status -eq "$want" ] && grep -qF -- "$text" <<<"$out" || { echo "\$ $*"; echo "$out"; echo "status $status"; return 1; }
}

# $try's status and output on IMAGE with $vell, the image's name and the
# scenario lines taken out; as nobody when asked and run as root.
tried() {  # tried [nobody] IMAGE ARG...
  local as=()
  [ "$1" = nobody ] && { [ "$(id -u)" -ne 0 ] || as=(setpriv --reuid=nobody --regid=nogroup --clear-groups); shift; }
  local image=$1
  shift
  "${as[@]}" "$try" --vell "$vell" "$@" "$image" 2>&1 | sed "s|$image|IMAGE|g; /^=== /d"
  echo "status ${PIPESTATUS[0]}"
}

# The confinement vell ended boot N with, in BOOTS ("boot N observed NAME
# VALUE" lines, dev/observe-vell): CAP_DAC_OVERRIDE alone, no new
# privileges, and a system-call filter; the bounding set is the init's.
confined() {  # confined BOOTS N
  local pattern
  for pattern in "CapEff 0000000000000002" "CapPrm 0000000000000002" \
    "CapInh 000000000000000[02]" "CapAmb 000000000000000[02]" "NoNewPrivs 1" "Seccomp 2"; do
    grep -qx "boot $2 observed $pattern" <<<"$1" || { echo "not observed: $pattern"; grep "^boot $2 observed" <<<"$1"; return 1; }
  done
}

# What the boots of an init other than systemd (dev/boot-init) must show:
# the system's data kept at the first, where the readers see Europe/Paris as
# this machine's zones have it now; the update placed after it promoted at
# the second before the first reader, which sees +0530; nothing changed at
# the third; vell's writes refused outside /var/db at the fourth.
init_boot_checks() {  # init_boot_checks LABEL BOOTS
  local label=$1 boots=$2 paris
  paris=$(TZ=Europe/Paris date +%z)
  v() { sed -n "s/^boot $1 $2 //p" <<<"$boots" | head -1; }
  check "$label: boot 1 keeps the system's data, where date and localtime(3) tell Europe/Paris's time" \
    test "$(v 1 'reader date')/$(v 1 'reader localtime(3)')" = "$paris/$paris"
  check "$label: vell's messages on the console" grep -q "^boot 3 message New update not compatible" <<<"$boots"
  check "$label: boot 2 promotes the update placed after boot 1" \
    test "$(v 2 'link zoneinfo')" = "$(sed -n 's/^placed //p' <<<"$boots")/zoneinfo"
  check "$label: ...before the first reader: date and localtime(3) tell the update's +0530" \
    test "$(v 2 'reader date')/$(v 2 'reader localtime(3)')/$(v 2 'reader localtime')" = \
    "+0530/+0530/$(v 1 'reader localtime')"
  check "$label: status 0" test -z "$(grep '^boot [123] message Cannot repair' <<<"$boots")"
  check "$label: boot 3 changed nothing" test "$(grep '^boot 2 link' <<<"$boots")" = \
    "$(grep '^boot 3 link' <<<"$boots" | sed 's/^boot 3/boot 2/')"
  check "$label: vell's writes outside /var/db refused by its own confinement" \
    grep -q '^boot 4 message create_symlink: .*: Permission denied$' <<<"$boots"
  check "$label: vell confined itself: CAP_DAC_OVERRIDE alone, no new privileges, a filter" confined "$boots" 1
  check "$label: ...its own, one more than the init and its container give" \
    test "$(v 1 'observed Seccomp_filters')" = "$(($(v 1 filters) + 1))"
}
