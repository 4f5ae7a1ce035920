// A compiled gettext message catalogue (.mo file), read without libintl: libintl keeps one
// process-wide language and catalogue state, while the caption is looked up per call, from many
// threads, possibly in different languages.
#ifndef KESTA_PLATFORM_LOCALE_MOCATALOGUE_H
#define KESTA_PLATFORM_LOCALE_MOCATALOGUE_H

#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace Kesta {
namespace platform {

class MoCatalogue {
 public:
  // The catalogue in `bytes`, in either byte order; nothing when the bytes are not a catalogue
  // or any table or string reaches past their end. Of a plural entry only the singular message
  // and its first translation are kept; the header entry (empty message id) and empty
  // translations are left out.
  static std::optional<MoCatalogue> parse(std::string_view bytes);

  // The translation of `messageId` (UTF-8 as the catalogue holds it), or null.
  const std::string* find(std::string_view messageId) const;

  std::size_t size() const { return messages_.size(); }

 private:
  std::vector<std::pair<std::string, std::string>> messages_;  // sorted by message id
};

}  // namespace platform
}  // namespace Kesta

#endif  // KESTA_PLATFORM_LOCALE_MOCATALOGUE_H
