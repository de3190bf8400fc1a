#include "GestureRings.h"

#include "LQ_Utils.h"

namespace {

std::string& directory() {
    static std::string value;
    return value;
}

// slot stays null until a load succeeds, so a failed first call leaves nothing half made
ClassifierRing* ringFromFile(const char* name, ClassifierRing*& slot) {
    if (slot) return slot;
    const std::string path = (directory().empty() ? std::string() : directory() + "/") + name + ".ring";
    ClassifierRing* ring = new ClassifierRing();
    try {
        const bool loaded = ring->load(path);
        LQ_ASSERT_MSG(loaded && ring->getNumClassifiers() > 0, "ring " << name << " has no data in '" << path << "'");
    } catch (...) {
        delete ring;
        throw;
    }
    slot = ring;
    return slot;
}

}  // namespace

void setRingDirectory(const std::string& value) { directory() = value; }
const std::string& ringDirectory() { return directory(); }

#define TACTUS_RING_FUNCTION(name)               \
    ClassifierRing* name() {                     \
        static ClassifierRing* pRing = nullptr;  \
        return ringFromFile(#name, pRing);       \
    }

TACTUS_RING_FUNCTION(ada_thumbUp_ada__2017_11_13__20_01_17)
TACTUS_RING_FUNCTION(ada_mono_ada_staticVictory_2017_11_10__14_34_17)
TACTUS_RING_FUNCTION(ada_Fist_2013_10_02__16_45_30)
TACTUS_RING_FUNCTION(ada_mono_ada_staticPointer0_2015_06_23__19_25_48)
TACTUS_RING_FUNCTION(ada__ada_staticPalm_2014_12_05__17_40_12)
TACTUS_RING_FUNCTION(ada_staticHeart_ada_staticHeart_2017_07_03__16_31_26)
