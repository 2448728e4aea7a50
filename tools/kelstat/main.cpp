// kelstat: command-line front end of the library.
#include <cstdio>
#include <cstring>

#include "kelstat.h"

int main(int argc, char** argv) {
    if (argc > 1 && std::strcmp(argv[1], "--version") == 0) {
        std::printf("kelstat %s\n", KELSTAT_VERSION_STRING);
        return 0;
    }
    std::fprintf(stderr, "usage: kelstat <command> [options]\n");
    return 2;
}
