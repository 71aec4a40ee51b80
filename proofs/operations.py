"""The meaning, lane by lane, of the functions of LLVM that are not instructions.

Clang makes instructions of most intrinsics, which `vectors.py` tries by themselves; these are left.
"SDM" is the processor's software developer's manual for x86-64, "Arm ARM" that for 32-bit ARM.
"""

import re

import terms as t


def fused(path, a, b, c):
    """a * b + c, rounded once: SDM vol. 2, VFMADD132PD and VFNMADD132PD; VFMADD132PS and so on."""
    del path
    return t.by_lanes(lambda x, y, z: t.rounded("fused", x, y, z), a, b, c)


def magnitude(path, a):
    """Without the sign bit; ANDPS or VABS."""
    del path
    return t.by_lanes(t.magnitude, a)


def nothing(path, *arguments):
    """Says only where a variable is in use."""
    del path, arguments


def control_word(path, pointer):
    """SDM vol. 2, STMXCSR."""
    word = t.variable("control_word", t.bits(32))
    path.memory[pointer.object].store(t.value_of(pointer.offset), word)


def all_zeros(path, a, b):
    """Whether a & b is zero: the zero flag in SDM vol. 2, PTEST."""
    del path
    both = t.of_bits("bvand", *(t.concat(*reversed(x)) for x in (a, b)))
    return t.extended("zero_extend", t.compared("=", both, t.constant(0, both.sort[1])), 32)


def greater_unsigned(path, a, b):
    """Arm ARM, VMAX (integer), for unsigned elements."""
    del path
    return t.by_lanes(lambda x, y: t.of_bits("umax", x, y), a, b)


KNOWN = {
    r"llvm\.arm\.neon\.vmaxu\.\w+": greater_unsigned,
    r"llvm\.fabs\.\w+": magnitude,
    r"llvm\.fma\.\w+": fused,
    r"llvm\.lifetime\.\w+\.\w+": nothing,
    r"llvm\.x86\.avx\.ptestz\.256": all_zeros,
    r"llvm\.x86\.sse\.stmxcsr": control_word,
}


def find(name):
    """The meaning of a function, or None."""
    return next((f for pattern, f in KNOWN.items() if re.fullmatch(pattern, name)), None)
