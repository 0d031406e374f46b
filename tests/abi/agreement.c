/* What library and host have agreed on, as C sees it; agreement.cpp is the other view. */
#include "tests/abi/layouts.h"
#include "tests/abi/signatures.h"

static const char bail_unit[] = "agreement";

/* Every macro of the headers, expanded in C. */
int agreement_in_c(int err, const void *pointer);
int agreement_in_c(int err, const void *pointer)
{
    BAIL_LOG("%d", err);
    OV_LOG(ov_log_info, "%d", err);
    OV_LOG_MODULE(ov_log_info, "%d", err);
    BAIL_ERROR(BAIL_REPORT(err));
    BAIL_NULL(pointer);
    BAIL_REQUIRE(err == 0);
    BAIL_ERROR_ANSWER(err, -1);
    BAIL_NULL_ANSWER(pointer, -1);
    return ts_length(NULL) + (ts_str(NULL) == NULL);
}

void agreement_without_answer(int err);
void agreement_without_answer(int err)
{
    BAIL_ERROR_ANSWER(err, );
}
