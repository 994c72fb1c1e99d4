#include "kernels/signal/signal_kernels.h"
#include "kernels/x86_64/choices.h"
#include "kernels/x86_64/choose.h"

QZ_SIGNAL_CHOICES(QZ_CHOOSE)
