// Making one article from a catalogue template (for a network, or from a single
// template) and purging the articles of a template's family that an update no longer
// lists; shared by the network, road and earthwork updates.
#pragma once

#include "schedule/schedule_store.hpp"
#include "zodevi/value_array.h"

#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace zodevi {

// True when the quantity key is the code pattern between double quotes with each
// placeholder replaced the way the pattern writes it: any text for "%s", a number with
// exactly the pattern's decimals for "%.2f" or "%.3f". Literal parts compare exactly.
bool KeyFitsPattern(std::string_view codePattern, std::string_view quantityKey);

// Network articles: texts of the template for the network index (low 16 bits), codes
// from the texts' prefix or else the first two characters of the network name. Each
// answers true when it created an article; an article already keyed so in the group,
// or a template without texts for the network, makes nothing.
bool InstantiateByName(CZodEVIBdr& bdr, int networkIndex, const std::string& networkName,
                       const CZodEVIArtTemplate& tmpl, const std::string& name, const std::string& groupKey,
                       CZodEVIGroup& group, bool newGroup);
bool InstantiateByValue(CZodEVIBdr& bdr, int networkIndex, const std::string& networkName,
                        const CZodEVIArtTemplate& tmpl, double value, const std::string& groupKey, CZodEVIGroup& group,
                        bool newGroup);
bool InstantiateByValues(CZodEVIBdr& bdr, int networkIndex, const std::string& networkName,
                         const CZodEVIArtTemplate& tmpl, double lower, double upper, const std::string& groupKey,
                         CZodEVIGroup& group, bool newGroup);

// A fixed article of a new network group: texts and code pattern taken as they stand,
// filed under the template's own category; no search for an existing article. False
// when the template has no texts for the network.
bool InstantiateFixed(CZodEVIBdr& bdr, int networkIndex, const std::string& networkName, const CZodEVIArtTemplate& tmpl,
                      const std::string& groupKey, CZodEVIGroup& group);

// Articles of single templates (comb ducts, road projects): the template's one text,
// its category as it stands, codes from its prefix only.
bool InstantiateSingleByName(CZodEVIBdr& bdr, const CZodEVIArtTemplate& tmpl, const std::string& name,
                             const std::string& groupKey, CZodEVIGroup& group, bool newGroup);
bool InstantiateSingleByValue(CZodEVIBdr& bdr, const CZodEVIArtTemplate& tmpl, double value,
                              const std::string& groupKey, CZodEVIGroup& group, bool newGroup);
bool InstantiateSingleByValues(CZodEVIBdr& bdr, const CZodEVIArtTemplate& tmpl, double lower, double upper,
                               const std::string& groupKey, CZodEVIGroup& group, bool newGroup);

// Removes from the schedule every article of the group that belongs to the template's
// family and whose key none of the entries forms; true when one went. A value family
// also requires the key to be as long as the pattern filled with zeros, so a depth of
// 12.50 m is not taken for a class bound of the shorter family sample.
bool PurgeByNames(CZodEVIBdr& bdr, const std::vector<std::string>& names, const CZodEVIArtTemplate& tmpl,
                  CZodEVIGroup& group);
bool PurgeByValues(CZodEVIBdr& bdr, const CZodEVIValueArray<double>& values, const CZodEVIArtTemplate& tmpl,
                   CZodEVIGroup& group);
bool PurgeByValuePairs(CZodEVIBdr& bdr, const std::vector<std::pair<double, double>>& pairs,
                       const CZodEVIArtTemplate& tmpl, CZodEVIGroup& group);

// The consecutive pairs (b0, b1), (b1, b2) ... of a list of bounds.
std::vector<std::pair<double, double>> ConsecutivePairs(const CZodEVIValueArray<double>& bounds);

// The templates of one kind, in catalogue order.
std::vector<const CZodEVIArtTemplate*> TemplatesOfKind(const CZodEVIBdr& bdr, int kind);

} // namespace zodevi
