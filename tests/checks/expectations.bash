#!/usr/bin/env bash
# What the checks share that are written as scripts; they source this file.

fail() {
    echo "FAILED: $*" >&2
    exit 1
}

# expect_same WHAT EXPECTED FOUND
expect_same() {
    [[ $2 == "$3" ]] && return
    diff <(echo "$2") <(echo "$3") || true
    fail "$1"
}

# Prints the names on standard input that neither the module nor a compiler may call.
unexpected_calls() {
    # Memory and mathematics; bcmp is Clang's memcmp for equality.
    local calls='memcmp|bcmp|modf|modff|pow|powf|ldexp|ldexpf'
    # What compilers call on their own account: the table of addresses, their table of what the
    # processor can do, the arithmetic and thread-local access that 32-bit ARM has no instructions
    # for, and checks of the stack where a distribution's compiler adds them. Not __tls_get_addr,
    # which may allocate.
    local compiler='_GLOBAL_OFFSET_TABLE_|__cpu_model|__aeabi_[a-z0-9_]+|__stack_chk_[a-z_]+'
    grep -Evx "$calls|$compiler" || true
}

# The names on standard input except functions of the standard library, which a build without
# optimisation defines instead of inlining them.
without_standard_library() {
    grep -Ev '^_Z(NK?)?St' || true
}
