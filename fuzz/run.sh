#!/usr/bin/env bash
# Runs one fuzz target for a while: fuzz/run.sh TARGET SECONDS [libFuzzer options...]
#   TARGET   utf_core encoders locale_names engine japanese local equivalence direction
#   SECONDS  wall time for the run (libFuzzer -max_total_time)
# Environment:
#   TEXTCONV_FUZZ_LOCALE  local encoding for local/equivalence, e.g. ja_JP.eucJP,
#                         ru_RU.KOI8-R, de_DE.ISO-8859-1 (locales are built on
#                         first use into the build folder)
#   TEXTCONV_FUZZ_BUILD   build folder (default build/fuzz, the "fuzz" preset)
# The growing corpus lives in the build folder (seeded from fuzz/corpus/TARGET);
# crash reproducers land in fuzz/findings/TARGET/ (not committed). The last
# line tells the executions and whether the run found anything; the exit
# status is libFuzzer's (0: nothing found).
set -euo pipefail
root=$(cd "$(dirname "$0")/.." && pwd)
target=${1:?usage: fuzz/run.sh TARGET SECONDS [libFuzzer options...]}
seconds=${2:?usage: fuzz/run.sh TARGET SECONDS [libFuzzer options...]}
shift 2
build=${TEXTCONV_FUZZ_BUILD:-$root/build/fuzz}
binary=$build/fuzz/fuzz_$target
[ -d "$root/fuzz/corpus/$target" ] || { echo "run.sh: no target $target" >&2; exit 2; }

if [ ! -x "$binary" ]; then
    (cd "$root" && cmake --preset fuzz >/dev/null && cmake --build --preset fuzz --target "fuzz_$target")
fi

if [ -n "${TEXTCONV_FUZZ_LOCALE:-}" ]; then
    sh "$root/tests/locales/generate.sh" "$build/locales" >/dev/null
    export LOCPATH=$build/locales
fi

label=$target${TEXTCONV_FUZZ_LOCALE:+-$TEXTCONV_FUZZ_LOCALE}
work=$build/corpus-work/$label
findings=$root/fuzz/findings/$target
mkdir -p "$work" "$findings"
log=$build/fuzz-$label.log

# No terminal on stdin: a missing converter is accepted, never asked about.
# The library's missing-converter lines are expected and dropped from the log.
set +e
TEXTCONV_HOST_ANSWER=yes "$binary" "$work" "$root/fuzz/corpus/$target" \
    -max_total_time="$seconds" -timeout=10 -rss_limit_mb=2048 -max_len=2048 -print_final_stats=1 \
    -artifact_prefix="$findings/" "$@" </dev/null 2>&1 |
    grep -v '^Cannot use iconv' >"$log"
pipeline=("${PIPESTATUS[@]}")
set -e
status=${pipeline[0]}
runs=$(sed -n 's/^stat::number_of_executed_units: *//p' "$log" | tail -1)
if [ "$status" = 0 ]; then
    echo "fuzz $label: ${runs:-?} executions in ${seconds}s, nothing found (log $log)"
else
    echo "fuzz $label: FAILED after ${runs:-?} executions (status $status), reproducer in $findings (log $log)"
    grep -E 'invariant broken|ERROR: |SUMMARY|runtime error|^artifact_prefix|Test unit written' "$log" | head -20
fi
exit "$status"
