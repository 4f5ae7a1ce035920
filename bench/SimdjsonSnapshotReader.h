// A reader of the JSON snapshot built on simdjson's On-Demand API, measured against the
// platform's own parser (parseNodeSnapshot) by the Parse.* benchmarks. It applies the same
// rules to the same text and must yield the same nodes; it only says whether the text was
// refused, not why.
#ifndef BLUELIGHT_BENCH_SIMDJSONSNAPSHOTREADER_H
#define BLUELIGHT_BENCH_SIMDJSONSNAPSHOTREADER_H

#include <string_view>
#include <vector>

#include "instrumentation/InstrumentationSource.h"

namespace bench {

// How the reader gets simdjson's parser and the padded copy of the text it needs.
enum class ParserUse {
  kKept,   // one kept between calls (the buffers are reused; another thread meanwhile gets its own)
  kFresh,  // a new one for every call
};

// The nodes of `text`, or false when the text breaks any rule of parseNodeSnapshot.
bool readSnapshotWithSimdjson(std::string_view text,
                              std::vector<Kesta::platform::InstrumentationNode>& nodes,
                              ParserUse use = ParserUse::kKept);

// Frees the kept parser and copy, so that the next call with ParserUse::kKept shows what they
// cost.
void releaseKeptParser();

}  // namespace bench

#endif  // BLUELIGHT_BENCH_SIMDJSONSNAPSHOTREADER_H
