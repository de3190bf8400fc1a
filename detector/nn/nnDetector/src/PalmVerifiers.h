#pragma once
// The two palm verifiers the rejectors ask for by name, in the two forms of a generated
// network unit. Each is made once: from "<name>.nn" in the network directory when that file
// is there, else from the trained tables compiled in; a broken file, or neither source,
// ends in a failed check, and the next call tries again. Every call of the second form gives an independent
// network that shares the loaded weights.

#include <string>

#include "NNDetector.h"

// where the ".nn" files are; empty means the working directory
void setNetworkDirectory(const std::string& directory);
const std::string& networkDirectory();

void palm_verifier__iter_250000(NNDetector& network);
LQ::SharedPtr<NNDetector> palm_verifier__iter_250000();
void palm_verifier_iter_140000(NNDetector& network);
LQ::SharedPtr<NNDetector> palm_verifier_iter_140000();
