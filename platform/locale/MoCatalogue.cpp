#include "locale/MoCatalogue.h"

#include <algorithm>
#include <cstdint>
#include <cstring>

namespace Kesta {
namespace platform {

namespace {

constexpr std::uint32_t kMagic = 0x950412DEU;
constexpr std::uint32_t kSwappedMagic = 0xDE120495U;
constexpr std::size_t kHeaderSize = 28;  // magic, revision, count, two table offsets, hash table

std::uint32_t swapBytes(std::uint32_t value) {
  return ((value & 0x000000FFU) << 24) | ((value & 0x0000FF00U) << 8) |
         ((value & 0x00FF0000U) >> 8) | ((value & 0xFF000000U) >> 24);
}

// Reads 32-bit words of the file in its byte order.
class WordReader {
 public:
  WordReader(std::string_view bytes, bool swapped) : bytes_(bytes), swapped_(swapped) {}

  // The word at `offset`; the caller has checked that it lies inside the file.
  std::uint32_t at(std::uint64_t offset) const {
    std::uint32_t value = 0;
    std::memcpy(&value, bytes_.data() + offset, sizeof value);
    return swapped_ ? swapBytes(value) : value;
  }

 private:
  std::string_view bytes_;
  bool swapped_;
};

// The string that a table entry (length, offset) describes, cut at its first NUL (plural forms
// follow it); nothing when the entry reaches past the end of the file.
std::optional<std::string_view> entryText(std::string_view bytes, const WordReader& words,
                                          std::uint64_t entryOffset) {
  const std::uint64_t length = words.at(entryOffset);
  const std::uint64_t offset = words.at(entryOffset + 4);
  if (offset > bytes.size() || length > bytes.size() - offset) {
    return std::nullopt;
  }
  std::string_view text = bytes.substr(offset, length);
  return text.substr(0, text.find('\0'));
}

}  // namespace

std::optional<MoCatalogue> MoCatalogue::parse(std::string_view bytes) {
  if (bytes.size() < kHeaderSize) {
    return std::nullopt;
  }
  std::uint32_t magic = 0;
  std::memcpy(&magic, bytes.data(), sizeof magic);
  if (magic != kMagic && magic != kSwappedMagic) {
    return std::nullopt;
  }
  const WordReader words(bytes, magic == kSwappedMagic);
  // Major revisions 0 and 1 share this layout; a later one would not be understood.
  const std::uint32_t majorRevision = words.at(4) >> 16;
  if (majorRevision > 1) {
    return std::nullopt;
  }
  const std::uint64_t count = words.at(8);
  const std::uint64_t originals = words.at(12);
  const std::uint64_t translations = words.at(16);
  // 64-bit arithmetic: count * 8 cannot overflow, and neither can the sums.
  if (originals > bytes.size() || count * 8 > bytes.size() - originals ||
      translations > bytes.size() || count * 8 > bytes.size() - translations) {
    return std::nullopt;
  }

  MoCatalogue catalogue;
  // The count comes from the file; it only bounds the loop, the memory follows real entries.
  catalogue.messages_.reserve(static_cast<std::size_t>(std::min<std::uint64_t>(count, 256)));
  for (std::uint64_t index = 0; index < count; ++index) {
    const std::optional<std::string_view> original = entryText(bytes, words, originals + index * 8);
    const std::optional<std::string_view> translation =
        entryText(bytes, words, translations + index * 8);
    if (!original || !translation) {
      return std::nullopt;
    }
    if (original->empty() || translation->empty()) {
      continue;
    }
    catalogue.messages_.emplace_back(std::string(*original), std::string(*translation));
  }
  // msgfmt writes the table sorted, but nothing forces a file to be; sort it here so the look-up
  // can search by halves. Of repeated ids the first one stays.
  std::stable_sort(catalogue.messages_.begin(), catalogue.messages_.end(),
                   [](const auto& a, const auto& b) { return a.first < b.first; });
  catalogue.messages_.erase(
      std::unique(catalogue.messages_.begin(), catalogue.messages_.end(),
                  [](const auto& a, const auto& b) { return a.first == b.first; }),
      catalogue.messages_.end());
  return catalogue;
}

const std::string* MoCatalogue::find(std::string_view messageId) const {
  const auto found =
      std::lower_bound(messages_.begin(), messages_.end(), messageId,
                       [](const auto& entry, std::string_view id) { return entry.first < id; });
  if (found == messages_.end() || found->first != messageId) {
    return nullptr;
  }
  return &found->second;
}

}  // namespace platform
}  // namespace Kesta
