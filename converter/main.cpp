// vi-modelconv: mesh files to the effect runtime's model file. See --help.

#include <iostream>
#include <string>
#include <vector>

#include "ConverterTool.h"
#include "MemoryCeiling.h"

int main(int argc, char** argv) {
    std::vector<std::string> arguments(argv + 1, argv + argc);
    // The ceiling is the tool's own: set here, before the import, from the
    // input the command line names (a bad command line is run's to report).
    vi::ConverterOptions options;
    std::string error;
    if (options.parse(arguments, error) && options.action == vi::ConverterOptions::Convert)
        vi::MemoryCeiling::apply(options.input);
    return vi::ConverterTool::run(arguments, std::cout, std::cerr);
}
