// A program that loads the runtime while it runs: runtime_by_dlopen SHARED_OBJECT.

#include "questions.h"

#include <cstdio>
#include <dlfcn.h>

int main(const int argc, char** argv) {
    if (argc != 2) {
        std::fputs("usage: runtime_by_dlopen SHARED_OBJECT\n", stderr);
        return 2;
    }
    void* const runtime = dlopen(argv[1], RTLD_NOW | RTLD_LOCAL);
    void* const function =
        runtime == nullptr ? nullptr : dlsym(runtime, "small_runtime_bytes_to_store");
    if (function == nullptr) {
        // NOLINTNEXTLINE(concurrency-mt-unsafe): no other thread runs yet
        std::fprintf(stderr, "%s\n", dlerror());
        return 2;
    }
    return ask_from_threads(reinterpret_cast<BytesToStore>(function));
}
