#include "kernels/quantised/quantised_kernels.h"
#include "kernels/x86_64/choices.h"
#include "kernels/x86_64/choose.h"

QZ_QUANTISED_CHOICES(QZ_CHOOSE)
