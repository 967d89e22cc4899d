#include "orvcim/CommandLine.h"

int main(int argc, char** argv) {
    return ObjectManager::Orvcim::run(argc, argv);
}
