// The benchmarks call kernels directly; the interface library wants an engine.
#include "LQ_ViInterface.h"

LQ::ViInterface* getEngine() { return nullptr; }
