// The standard catalogue: the 53 article templates every schedule carries, from which
// the updates create articles.
#pragma once

#include "schedule/art_template.hpp"

namespace zodevi {

// Number of network indexes that have texts (0 EP ... 11 heating, 12 other).
inline constexpr int kNetworkIndexCount = 13;

// Appends the 53 templates, in catalogue order, to the array.
void FillStandardCatalogue(CZodEVIArtTemplateArray& catalogue);

// The numbering prefix of a network index ("EP", "EU", "AEP", ...); empty for 12 and
// above, where the generators take the network name's first characters.
const char* NetworkNumberingPrefix(int networkIndex);

} // namespace zodevi
