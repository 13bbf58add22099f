// Every refusal is logged, and nearly every input is refused: only what the sanitizers say is wanted.
#include "fuzz/Fuzz.h"
#include "platform/log.h"

extern "C" int LLVMFuzzerInitialize(int* argc, char*** argv);

extern "C" int LLVMFuzzerInitialize(int*, char***) {
    dlog_set_threshold(static_cast<log_priority>(DLOG_ERROR + 1));
    return 0;
}
