#!/usr/bin/env bash
# gallery_test.sh GALLERY APPLY_FILTER SOURCES SCRATCH: makes the gallery and holds it against the documentation.
set -u
gallery=$1 apply_filter=$2 sources=$3 scratch=$4
failures=0
rm -rf "$scratch"
mkdir -p "$scratch"

fail() {
    echo "FAILED: $*"
    failures=$((failures + 1))
}

"$gallery" "$sources/examples/data/coffee.png" "$scratch/sheet.png" > "$scratch/table" || fail "status of the gallery"
[ -s "$scratch/sheet.png" ] || fail "no contact sheet"

# Every filter, and the targets that it runs on, as the page says.
grep '^|' "$sources/docs/gallery.md" > "$scratch/documented"
diff "$scratch/documented" "$scratch/table" || fail "docs/gallery.md is not of this library (run scripts/gallery)"
grep -q neither "$scratch/table" && fail "a filter runs on no target"

# The list of filters has the same names and the same targets.
grep -oE '`[^`]*` \((both|CPU|OpenGL)\)' "$scratch/table" | sed 's/`//g' | sort > "$scratch/shown"
"$apply_filter" --list > "$scratch/list" || fail "status of --list"
awk '
    /^[^ ]/ { name = $1 }
    /^    runs on cpu, gl$/ { print name " (both)" }
    /^    runs on cpu$/ { print name " (CPU)" }
    /^    runs on gl$/ { print name " (OpenGL)" }' "$scratch/list" | sort > "$scratch/listed"
diff "$scratch/listed" "$scratch/shown" || fail "--list and the gallery differ"
[ "$(wc -l < "$scratch/shown")" -eq "$(grep -c '^[^ ]' "$scratch/list")" ] || fail "a filter without a target"

[ $failures -eq 0 ] && echo "all passed"
exit $failures
