"""The functions of code.cpp in LLVM's representation, by Clang with the flags of the library."""

import claims
import compiled
import translate

# The library's vectors for ARM are those of NEON.
PLATFORMS = {
    "x86-64": [],
    "arm": ["--target=arm-linux-gnueabihf", "-mfpu=neon"],
    "aarch64": ["--target=aarch64-linux-gnu"],
}


def functions(platform, level):
    """Those about which there are claims, compiled for a platform at a level of optimisation."""
    module = translate.Module(compiled.representation([*PLATFORMS[platform], level], "code.cpp"))
    names = map(compiled.name_of, compiled.demangled(module.functions))
    found = {}
    for name, symbol in zip(names, module.functions):
        qualified, bracket, rest = name.partition("<")
        kind = qualified.rpartition("::")[2]
        if kind in claims.OF_KIND:
            found[kind + bracket + rest] = symbol
    return claims.Functions(module, found, platform)
