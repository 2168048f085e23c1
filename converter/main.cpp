// vi-modelconv: mesh files to the effect runtime's model file. See --help.

#include <iostream>
#include <string>
#include <vector>

#include "ConverterTool.h"

int main(int argc, char** argv) {
    std::vector<std::string> arguments(argv + 1, argv + argc);
    return vi::ConverterTool::run(arguments, std::cout, std::cerr);
}
