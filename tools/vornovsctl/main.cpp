/**
 * vornovsctl: registers clients of the switch from the command line and tells how things are.
 */
#include "run.h"

#include <iostream>

int main(int argc, char* argv[])
{
    return vornovsctl::Run(argc, argv, std::cout, std::cerr);
}
