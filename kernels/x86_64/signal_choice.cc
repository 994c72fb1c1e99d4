#include "choices.h"
#include "choose.h"
#include "signal_kernels.h"

QZ_SIGNAL_CHOICES(QZ_CHOOSE)
