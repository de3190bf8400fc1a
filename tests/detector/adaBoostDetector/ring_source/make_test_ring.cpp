// Writes a random ring as "<out>.ring" and as generated source "<out>.cpp", so that the
// build can compile the source and the tests compare both with the ring made in memory.
#include <cstdio>
#include <cstdlib>
#include <string>

#include "LQ_FileUtils.h"
#include "RandomRing.h"

int main(int argc, char** argv) {
    if (argc != 3) {
        std::fprintf(stderr, "usage: make_test_ring SEED OUT\n");
        return 2;
    }
    const std::string out = argv[2];
    RandomRing made = makeRandomRing(static_cast<unsigned int>(std::atoi(argv[1])), LQ::getFileName(out));
    if (!made.ring->save(out + ".ring") || !made.ring->saveHeader(out + ".cpp")) {
        std::fprintf(stderr, "cannot write %s\n", out.c_str());
        return 1;
    }
    return 0;
}
