#pragma once
// What a generated ring unit needs: the classes its building code calls and the scanner
// its second and third functions return.

#include <map>
#include <string>
#include <vector>

#include "BaseDetector.h"
#include "CascadedClassifier.h"
#include "ClassifierRing.h"
#include "LQ_ObjectLocation.h"
#include "LQ_Rect.h"
#include "LQ_SharedPtr.h"
#include "LQ_Size.h"
#include "LQ_Utils.h"
#include "PatternDetector.h"
#include "StrongClassifier.h"
#include "WeakClassifier.h"

// one byte of a generated table row
typedef LQ::schar cData;
