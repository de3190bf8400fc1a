#include "PalmVerifiers.h"

#include <fstream>

#include "LQ_ArchiveI.h"
#include "LQ_Utils.h"

// Networks whose generated tables are compiled in (models/networks) have a builder with C
// linkage under "compiled_" and their name; the build defines TACTUS_COMPILED_<name>.
#define TACTUS_DECLARE_COMPILED(name) extern "C" void compiled_##name(NNDetector& network);
#ifdef TACTUS_COMPILED_palm_verifier__iter_250000
TACTUS_DECLARE_COMPILED(palm_verifier__iter_250000)
#define TACTUS_BUILDER_PALM_250000 &compiled_palm_verifier__iter_250000
#else
#define TACTUS_BUILDER_PALM_250000 nullptr
#endif
#ifdef TACTUS_COMPILED_palm_verifier_iter_140000
TACTUS_DECLARE_COMPILED(palm_verifier_iter_140000)
#define TACTUS_BUILDER_PALM_140000 &compiled_palm_verifier_iter_140000
#else
#define TACTUS_BUILDER_PALM_140000 nullptr
#endif

namespace {

typedef void (*Builder)(NNDetector&);

std::string& directory() {
    static std::string value;
    return value;
}

// A network file in the network directory wins, so that models can be swapped without a
// rebuild; otherwise the compiled tables, if any. slot stays null until a network is had, so
// a failed first call leaves nothing half made.
const NnDetector& networkFor(const char* name, LQ::SharedPtr<NnDetector>& slot, Builder compiled) {
    if (slot) return *slot;
    const std::string path = (directory().empty() ? std::string() : directory() + "/") + name + ".nn";
    LQ::SharedPtr<NnDetector> network(new NnDetector());
    if (compiled && !std::ifstream(path))
        compiled(*network);
    else
        LQ::ArchiveI::load(path, *network);
    LQ_ASSERT_MSG(network->isLoaded(), "network " << name << " has no data in '" << path << "'");
    slot = network;
    return *slot;
}

}  // namespace

void setNetworkDirectory(const std::string& value) { directory() = value; }
const std::string& networkDirectory() { return directory(); }

#define TACTUS_NETWORK_FUNCTION(name, builder)                                       \
    namespace {                                                                      \
    const NnDetector& name##Source() {                                               \
        static LQ::SharedPtr<NnDetector> network;                                    \
        return networkFor(#name, network, builder);                                  \
    }                                                                                \
    }                                                                                \
    void name(NNDetector& network) { network = *name##Source().clone(); }            \
    LQ::SharedPtr<NNDetector> name() { return name##Source().clone(); }

TACTUS_NETWORK_FUNCTION(palm_verifier__iter_250000, TACTUS_BUILDER_PALM_250000)
TACTUS_NETWORK_FUNCTION(palm_verifier_iter_140000, TACTUS_BUILDER_PALM_140000)
