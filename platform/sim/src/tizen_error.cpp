// The thread's last platform result, as the platform keeps it.
#include <tizen_error.h>

namespace {
__thread int lastResult = TIZEN_ERROR_NONE;
char unknownError[] = "Unknown error";
char noError[] = "Successful";
}  // namespace

extern "C" {

int get_last_result(void) { return lastResult; }

void set_last_result(int result) { lastResult = result; }

char* get_error_message(int result) { return result == TIZEN_ERROR_NONE ? noError : unknownError; }

}  // extern "C"
