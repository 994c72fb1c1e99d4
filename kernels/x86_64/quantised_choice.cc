#include "choices.h"
#include "choose.h"
#include "quantised_kernels.h"

QZ_QUANTISED_CHOICES(QZ_CHOOSE)
