/**
 * vornovsctl: puts the host on the switch and back from the command line, manages what is on the
 * switch, and tells how things are.
 */
#include "run.h"

#include <iostream>

int main(int argc, char* argv[])
{
    return vornovsctl::Run(argc, argv, std::cout, std::cerr, vornovsctl::StandardOutput());
}
