#include "GestureRings.h"

#include <fstream>

#include "LQ_Utils.h"

// Rings whose generated tables are compiled in (models/rings) have a builder of their own,
// with C linkage under the ring's name; the build defines TACTUS_COMPILED_<name> for each.
#define TACTUS_DECLARE_COMPILED(name)  \
    namespace generated {              \
    extern "C" ClassifierRing* name(); \
    }

#ifdef TACTUS_COMPILED_ada_thumbUp_ada__2017_11_13__20_01_17
TACTUS_DECLARE_COMPILED(ada_thumbUp_ada__2017_11_13__20_01_17)
#define TACTUS_BUILDER_THUMB_UP &generated::ada_thumbUp_ada__2017_11_13__20_01_17
#else
#define TACTUS_BUILDER_THUMB_UP nullptr
#endif
#ifdef TACTUS_COMPILED_ada_mono_ada_staticVictory_2017_11_10__14_34_17
TACTUS_DECLARE_COMPILED(ada_mono_ada_staticVictory_2017_11_10__14_34_17)
#define TACTUS_BUILDER_VICTORY &generated::ada_mono_ada_staticVictory_2017_11_10__14_34_17
#else
#define TACTUS_BUILDER_VICTORY nullptr
#endif
#ifdef TACTUS_COMPILED_ada_Fist_2013_10_02__16_45_30
TACTUS_DECLARE_COMPILED(ada_Fist_2013_10_02__16_45_30)
#define TACTUS_BUILDER_FIST &generated::ada_Fist_2013_10_02__16_45_30
#else
#define TACTUS_BUILDER_FIST nullptr
#endif
#ifdef TACTUS_COMPILED_ada_mono_ada_staticPointer0_2015_06_23__19_25_48
TACTUS_DECLARE_COMPILED(ada_mono_ada_staticPointer0_2015_06_23__19_25_48)
#define TACTUS_BUILDER_POINTER &generated::ada_mono_ada_staticPointer0_2015_06_23__19_25_48
#else
#define TACTUS_BUILDER_POINTER nullptr
#endif
#ifdef TACTUS_COMPILED_ada__ada_staticPalm_2014_12_05__17_40_12
TACTUS_DECLARE_COMPILED(ada__ada_staticPalm_2014_12_05__17_40_12)
#define TACTUS_BUILDER_PALM &generated::ada__ada_staticPalm_2014_12_05__17_40_12
#else
#define TACTUS_BUILDER_PALM nullptr
#endif
#ifdef TACTUS_COMPILED_ada_staticHeart_ada_staticHeart_2017_07_03__16_31_26
TACTUS_DECLARE_COMPILED(ada_staticHeart_ada_staticHeart_2017_07_03__16_31_26)
#define TACTUS_BUILDER_HEART &generated::ada_staticHeart_ada_staticHeart_2017_07_03__16_31_26
#else
#define TACTUS_BUILDER_HEART nullptr
#endif

namespace {

typedef ClassifierRing* (*Builder)();

std::string& directory() {
    static std::string value;
    return value;
}

// A ring file in the ring directory wins, so that models can be swapped without a
// rebuild; otherwise the compiled tables, if any. slot stays null until a ring is had, so a
// failed first call leaves nothing half made.
ClassifierRing* ringFor(const char* name, ClassifierRing*& slot, Builder compiled) {
    if (slot) return slot;
    const std::string path = (directory().empty() ? std::string() : directory() + "/") + name + ".ring";
    if (compiled && !std::ifstream(path)) {
        slot = compiled();
        return slot;
    }
    ClassifierRing* ring = new ClassifierRing();
    try {
        const bool loaded = ring->load(path);
        LQ_ASSERT_MSG(loaded && ring->getNumClassifiers() > 0,
                      "ring " << name << " has no data in '" << path << "'");
    } catch (...) {
        delete ring;
        throw;
    }
    slot = ring;
    return slot;
}

}  // namespace

void setRingDirectory(const std::string& value) {
    directory() = value;
}
const std::string& ringDirectory() {
    return directory();
}
bool hasCompiledRing(const std::string& name) {
    const struct {
        const char* name;
        Builder builder;
    } rings[] = {{"ada_thumbUp_ada__2017_11_13__20_01_17", TACTUS_BUILDER_THUMB_UP},
                 {"ada_mono_ada_staticVictory_2017_11_10__14_34_17", TACTUS_BUILDER_VICTORY},
                 {"ada_Fist_2013_10_02__16_45_30", TACTUS_BUILDER_FIST},
                 {"ada_mono_ada_staticPointer0_2015_06_23__19_25_48", TACTUS_BUILDER_POINTER},
                 {"ada__ada_staticPalm_2014_12_05__17_40_12", TACTUS_BUILDER_PALM},
                 {"ada_staticHeart_ada_staticHeart_2017_07_03__16_31_26", TACTUS_BUILDER_HEART}};
    for (const auto& ring : rings)
        if (name == ring.name) return ring.builder != nullptr;
    return false;
}

#define TACTUS_RING_FUNCTION(name, builder)     \
    ClassifierRing* name() {                    \
        static ClassifierRing* pRing = nullptr; \
        return ringFor(#name, pRing, builder);  \
    }

TACTUS_RING_FUNCTION(ada_thumbUp_ada__2017_11_13__20_01_17, TACTUS_BUILDER_THUMB_UP)
TACTUS_RING_FUNCTION(ada_mono_ada_staticVictory_2017_11_10__14_34_17, TACTUS_BUILDER_VICTORY)
TACTUS_RING_FUNCTION(ada_Fist_2013_10_02__16_45_30, TACTUS_BUILDER_FIST)
TACTUS_RING_FUNCTION(ada_mono_ada_staticPointer0_2015_06_23__19_25_48, TACTUS_BUILDER_POINTER)
TACTUS_RING_FUNCTION(ada__ada_staticPalm_2014_12_05__17_40_12, TACTUS_BUILDER_PALM)
TACTUS_RING_FUNCTION(ada_staticHeart_ada_staticHeart_2017_07_03__16_31_26, TACTUS_BUILDER_HEART)
