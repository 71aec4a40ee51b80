#!/usr/bin/env bash
# What the checks of built files share; they source it.

failures=0
fail() {
    echo "FAILED: $*"
    failures=$((failures + 1))
}

# expect_same WHAT EXPECTED FOUND
expect_same() {
    if [[ $2 != "$3" ]]; then
        fail "$1"
        diff <(echo "$2") <(echo "$3") || true
    fi
}

# conclude MESSAGE: prints it and succeeds when nothing has failed.
conclude() {
    ((failures == 0)) && echo "$1"
}

# Of the names on standard input, those that neither the module nor a compiler may call.
unexpected_calls() {
    # Memory and mathematics; bcmp is Clang's memcmp for equality.
    local calls='memcmp|bcmp|modf|modff|pow|powf|ldexp|ldexpf'
    # What compilers call on their own account: the table of addresses, the arithmetic and
    # thread-local access that 32-bit ARM has no instructions for, and checks of the stack where a
    # distribution's compiler adds them. Not __tls_get_addr, which may allocate.
    local compiler='_GLOBAL_OFFSET_TABLE_|__aeabi_[a-z0-9_]+|__stack_chk_[a-z_]+'
    grep -Evx "$calls|$compiler" || true
}

# The names on standard input but for functions of the standard library, which a build without
# optimisation defines instead of inlining them.
without_standard_library() {
    grep -Ev '^_Z(NK?)?St' || true
}
