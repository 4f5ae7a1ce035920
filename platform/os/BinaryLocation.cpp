#include "os/BinaryLocation.h"

#include <dlfcn.h>
#include <sys/auxv.h>

#include <filesystem>
#include <string>
#include <system_error>

namespace Kesta {
namespace platform {

namespace {

std::string locateOwnBinary() {
  Dl_info self = {};
  if (::dladdr(reinterpret_cast<void*>(&locateOwnBinary), &self) == 0) {
    return std::string();
  }
  // For code in the main program dladdr reports argv[0], which may be relative to a directory
  // the process has left or a bare command name; the kernel's link names the file reliably.
  bool inMainProgram = self.dli_fname == nullptr || self.dli_fname[0] == '\0';
  if (const unsigned long programHeaders = ::getauxval(AT_PHDR);
      !inMainProgram && programHeaders != 0) {
    Dl_info mainProgram = {};
    // The auxiliary vector gives the program headers' address as an integer.
    inMainProgram = ::dladdr(reinterpret_cast<void*>(  // NOLINT(performance-no-int-to-ptr)
                                 programHeaders),
                             &mainProgram) != 0 &&
                    mainProgram.dli_fbase == self.dli_fbase;
  }
  std::error_code error;
  std::filesystem::path file;
  if (inMainProgram) {
    file = std::filesystem::read_symlink("/proc/self/exe", error);
  } else {
    file = std::filesystem::canonical(self.dli_fname, error);
    if (error) {
      file = self.dli_fname;
    }
  }
  if (error && file.empty()) {
    return std::string();
  }
  return file.parent_path().string();
}

}  // namespace

std::string ownBinaryDirectory() {
  static const std::string directory = locateOwnBinary();
  return directory;
}

}  // namespace platform
}  // namespace Kesta
