# Sourced by the tests in bash: counts what is expected and what was not found.
checks=0 failures=0

expect() { # NAME EXPECTED FOUND
    checks=$((checks + 1))
    [ "$2" == "$3" ] && return
    printf '%s:\n  expected: %s\n  found:    %s\n' "$1" "$2" "$3"
    failures=$((failures + 1))
}

skip() { # REASON: this machine cannot run the test, which DRAVIK_SKIPS_ARE_FAILURES=ON does not allow
    echo "skipped: $1"
    [ "${DRAVIK_SKIPS_ARE_FAILURES:-}" != ON ] || exit 1
    exit 77
}
