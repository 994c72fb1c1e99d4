// Takes the place of the library that asks the processor.

#include "processor.h"

qz::InstructionSet qz::BestInstructionSet() { return InstructionSet::QZ_PRETEND; }
