// The golden cases of this folder (*_cases.txt), each run through ovmacro.
#include "support/golden.h"

OVMACRO_GOLDEN_CASES(expr);
