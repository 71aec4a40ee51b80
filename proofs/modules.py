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
    found = {name: symbol for name, symbol in zip(names, module.functions)
             if name.partition("<")[0] in claims.OF_KIND}
    return claims.Functions(module, found, platform)
