// The schedule's exchange with the metre module: reading the file into the store (with
// the project-wide articles), writing it back, the editor and its changes, and the price
// queries by quantity selector.
#pragma once

#include "schedule/schedule_store.hpp"
#include "velsiblings/metre_services.h"

#include <cstdint>
#include <functional>
#include <map>
#include <string>
#include <vector>

namespace zodevi {

// The code pattern of a quantity selector (0 to 12); empty outside.
std::string QuantityPatternOfSelector(int selector);

// Clears the store, then fills it from the file. On failure the store stays empty, even
// when the metre module delivered part of the file first; a file that exists but does
// not read is then kept from every write (and the editor) until a read of it succeeds.
bool Read(CZodEVIBdr& bdr);
// Reads another file (or the same) and, only when it reads, makes it the schedule's file
// and content; otherwise the schedule keeps its file and content.
bool ReadFrom(CZodEVIBdr& bdr, const std::string& path);
// Hands every article to the metre module, in schedule order, unless the file could not
// be read or changed on disk since it was read or written here. A change is told on the
// command line; a script stops there, a user chooses between reading the file again with
// the changes made in memory (RecordPendingChange) made again on it, and replacing it.
bool Write(CZodEVIBdr& bdr);
// Remembers a change made in memory, to be made again on a newer version of the file.
void RecordPendingChange(CZodEVIBdr& bdr, std::function<void(CZodEVIBdr&)> change);
// Opens the editor (on the article with that tree path, or the whole schedule) and
// mirrors its changes in the store; writes the file again when an added article took a
// neighbour's group key. False when the editor did not close normally.
bool Edit(CZodEVIBdr& bdr, const std::string& treePath);

// Unit price of the article counting the quantity; 0 and false when there is none. An
// empty network name means RSX_GENERAL.
bool GetPrice(const CZodEVIBdr& bdr, int selector, const std::string& item, double& price,
              const std::string& networkName);
// Network name -> price text of every updated network and of RSX_GENERAL ("*"); prices
// are written in the shortest text that reads back equal.
bool GetPricesPerNetwork(const CZodEVIBdr& bdr, int selector, const std::string& item,
                         std::map<std::string, std::string>& prices);
bool SetPrice(CZodEVIBdr& bdr, int selector, const std::string& item, double price, const std::string& networkName);
// Opens the editor on the article counting the quantity, or says that none does. An
// empty network name searches every group for selectors 2-5, 7 and 8.
bool ShowPrice(CZodEVIBdr& bdr, int selector, const std::string& item, const std::string& networkName);

} // namespace zodevi
