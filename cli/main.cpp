// bluelight-cli: runs CIM read operations on the blue-light provider library in-process.
#include <iostream>
#include <string>
#include <vector>

#include "LibraryLocation.h"
#include "Tool.h"

int main(int argc, char** argv) {
  const std::vector<std::string> arguments(argv + 1, argv + argc);
  const bluelight::cli::ToolIo io{bluelight::cli::currentExecutablePath(argv[0]), std::cout,
                                  std::cerr};
  return bluelight::cli::runTool(arguments, io);
}
