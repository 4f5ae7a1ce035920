// The files that hold the account a source logs in with ("ipmi-lan:", "redfish:"). An account
// never comes from the source text, the environment or the command line, which other users of
// the machine can see; it comes from a file that only its owner can read, and it is never written
// to a log. Every source that needs an account reads its file through this one implementation, so
// the file is checked by the same rules and refused in the same words whatever the source:
//
//   - an absolute path, naming a regular file that belongs to the process's user or to root and
//     gives its group and others no permission at all (checked on the opened file, before a byte
//     of it is read), at most 4096 bytes;
//   - "name = value" lines: the value is everything after the first '=' without the blanks and
//     tabs around it; names are case-insensitive and may appear once; blank lines and lines
//     starting with '#' are ignored; Windows line ends are accepted.
//
// Which names a file may hold is the source's business (IpmiCredentials, RedfishCredentials).
// Messages name the file and the line number, never a name or value read from the file.
#ifndef KESTA_PLATFORM_INSTRUMENTATION_CREDENTIALSFILE_H
#define KESTA_PLATFORM_INSTRUMENTATION_CREDENTIALSFILE_H

#include <sys/stat.h>
#include <sys/types.h>

#include <cstddef>
#include <functional>
#include <string>
#include <string_view>

#include "os/FileSystem.h"

namespace Kesta {
namespace platform {

// The largest credentials file; a file of a handful of short lines, so anything bigger is the
// wrong file.
constexpr std::size_t kCredentialsFileLimit = 4096;

// Overwrites the characters of `text`, then empties it.
void wipe(std::string& text) noexcept;

// Why a file with status `info` must not hold credentials for a process running as `user`, or
// "" when it may: it must be a regular file, owned by that user or by root, and give its group
// and others no permission at all.
std::string credentialsFileProblem(const struct stat& info, uid_t user);

// Throws SourceError("credentials file \"<file>\" <why>").
[[noreturn]] void refuseCredentialsFile(const std::string& file, const std::string& why);

// "line <number>", as the messages about a line of the file name it.
std::string credentialsLineText(std::size_t number);

// One "name = value" line of a credentials file.
struct CredentialsLine {
  std::size_t number = 0;  // from 1
  std::string name;        // in lower case
  std::string_view value;  // without the blanks around it; points into the file's text
};

// Calls `take` for every "name = value" line of `text`, in order. Refuses (SourceError, naming
// `file`) a line that is not "name = value", a value holding a NUL character and a name given
// twice; `take` refuses the names it does not know and the values it cannot use, by
// refuseCredentialsFile.
void forEachCredentialsLine(std::string_view text, const std::string& file,
                            const std::function<void(const CredentialsLine&)>& take);

// Checks the file at `file` (an absolute path) through `files` with credentialsFileProblem for
// the process's effective user, before a byte of it is read, reads it (at most
// kCredentialsFileLimit bytes) and hands its text to `parse`. The bytes are overwritten when
// `parse` returns or throws. Throws SourceError.
void readCredentialsFile(const std::string& file, FileSystem& files,
                         const std::function<void(std::string_view)>& parse);

}  // namespace platform
}  // namespace Kesta

#endif  // KESTA_PLATFORM_INSTRUMENTATION_CREDENTIALSFILE_H
