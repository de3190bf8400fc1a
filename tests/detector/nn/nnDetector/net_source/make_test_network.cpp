// Writes the small palm shape with random weights as "<out>.nn" and as generated source
// "<out>.cpp", so that the build compiles the source and the tests compare both forms
// with the network made in memory.
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <string>

#include "LQ_ArchiveO.h"
#include "LQ_FileUtils.h"
#include "PalmNetworks.h"

int main(int argc, char** argv) {
    if (argc != 3) {
        std::fprintf(stderr, "usage: make_test_network SEED OUT\n");
        return 2;
    }
    const std::string out = argv[2];
    NnDetector net = palmNetwork(LQ::getFileName(out), kPalm35x33, LQ::BaseSize<int>(35, 33),
                                 static_cast<unsigned int>(std::atoi(argv[1])));
    net.setTrainLog("random weights, seed " + std::string(argv[1]) + "\nnot trained");
    std::ofstream file(out + ".nn", std::ios::binary);
    LQ::ArchiveO archive(file);
    archive & net;
    file.close();
    if (!file || !net.saveToCpp(out + ".cpp")) {
        std::fprintf(stderr, "cannot write %s\n", out.c_str());
        return 1;
    }
    return 0;
}
