// A program that is linked with the runtime's shared object.

#include "questions.h"

int main() {
    return ask_from_threads(&small_runtime_bytes_to_store);
}
