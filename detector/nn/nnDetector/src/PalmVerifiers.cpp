#include "PalmVerifiers.h"

#include "LQ_ArchiveI.h"
#include "LQ_Utils.h"

namespace {

std::string& directory() {
    static std::string value;
    return value;
}

// slot stays null until a load succeeds, so a failed first call leaves nothing half made
const NnDetector& networkFromFile(const char* name, LQ::SharedPtr<NnDetector>& slot) {
    if (slot) return *slot;
    const std::string path = (directory().empty() ? std::string() : directory() + "/") + name + ".nn";
    LQ::SharedPtr<NnDetector> network(new NnDetector());
    LQ::ArchiveI::load(path, *network);
    LQ_ASSERT_MSG(network->isLoaded(), "network " << name << " has no data in '" << path << "'");
    slot = network;
    return *slot;
}

}  // namespace

void setNetworkDirectory(const std::string& value) { directory() = value; }
const std::string& networkDirectory() { return directory(); }

#define TACTUS_NETWORK_FUNCTION(name)                                                \
    namespace {                                                                      \
    const NnDetector& name##Source() {                                               \
        static LQ::SharedPtr<NnDetector> network;                                    \
        return networkFromFile(#name, network);                                      \
    }                                                                                \
    }                                                                                \
    void name(NNDetector& network) { network = *name##Source().clone(); }            \
    LQ::SharedPtr<NNDetector> name() { return name##Source().clone(); }

TACTUS_NETWORK_FUNCTION(palm_verifier__iter_250000)
TACTUS_NETWORK_FUNCTION(palm_verifier_iter_140000)
