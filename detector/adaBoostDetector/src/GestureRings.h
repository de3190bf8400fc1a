#pragma once
// The rings the gesture engines ask for by name. Each function builds its ring on the
// first call and returns the same one ever after. A file "<name>.ring" in the ring
// directory wins; without one, the ring's generated tables if they are compiled in
// (models/rings); with neither, or an unreadable file, the call ends in a failed check and
// the next call tries again.

#include <string>

#include "ClassifierRing.h"

// where the ".ring" files are; empty means the working directory
void setRingDirectory(const std::string& directory);
const std::string& ringDirectory();
// whether the ring of this name has its tables compiled in
bool hasCompiledRing(const std::string& name);

ClassifierRing* ada_thumbUp_ada__2017_11_13__20_01_17();
ClassifierRing* ada_mono_ada_staticVictory_2017_11_10__14_34_17();
ClassifierRing* ada_Fist_2013_10_02__16_45_30();
ClassifierRing* ada_mono_ada_staticPointer0_2015_06_23__19_25_48();
ClassifierRing* ada__ada_staticPalm_2014_12_05__17_40_12();
ClassifierRing* ada_staticHeart_ada_staticHeart_2017_07_03__16_31_26();
