// Indexing the handles of a drawing file and giving new ones.
#include "host/dxf/handles.hpp"

#include <algorithm>

#include "text/text.hpp"

namespace vel::dxf {

bool Handles::Index(const Sections& records, std::uint64_t handseed, ParseError& error)
{
    index_.reserve(records.size());
    std::uint64_t maxHandle = 0;
    for (std::size_t i = 0; i < records.size(); ++i)
        if (records[i].handle != 0) {
            index_.push_back({records[i].handle, static_cast<std::uint32_t>(i)});
            maxHandle = std::max(maxHandle, records[i].handle);
        }
    // Handles mostly rise through each section: merge the ascending runs rather than
    // sort from scratch, unless the file is too shuffled for that to pay.
    std::vector<std::size_t> runs{0};
    for (std::size_t k = 1; k < index_.size() && runs.size() <= 64; ++k)
        if (index_[k] < index_[k - 1])
            runs.push_back(k);
    if (runs.size() > 64) {
        std::sort(index_.begin(), index_.end());
    } else {
        runs.push_back(index_.size());
        while (runs.size() > 2) {
            std::vector<std::size_t> merged{0};
            for (std::size_t r = 0; r + 2 < runs.size(); r += 2) {
                std::inplace_merge(index_.begin() + static_cast<std::ptrdiff_t>(runs[r]),
                                   index_.begin() + static_cast<std::ptrdiff_t>(runs[r + 1]),
                                   index_.begin() + static_cast<std::ptrdiff_t>(runs[r + 2]));
                merged.push_back(runs[r + 2]);
            }
            if (runs.size() % 2 == 0) // an odd number of runs: the last one waits
                merged.push_back(runs.back());
            runs = std::move(merged);
        }
    }
    for (std::size_t k = 1; k < index_.size(); ++k)
        if (index_[k].first == index_[k - 1].first) {
            const Record& a = records[std::min(index_[k].second, index_[k - 1].second)];
            const Record& b = records[std::max(index_[k].second, index_[k - 1].second)];
            error = {b.line, FormatString("un identifiant unique (%s est déjà celui de la ligne %u)",
                                          FormatHandle(b.handle).c_str(), a.line)};
            return false;
        }
    // maxHandle + 1 wraps to 0 when the file used the last handle: nothing can be added.
    next_ = maxHandle == UINT64_MAX ? 0 : std::max(handseed, maxHandle + 1);
    return true;
}

std::size_t Handles::FindInFile(std::uint64_t handle) const
{
    const auto it = std::lower_bound(index_.begin(), index_.end(), std::pair<std::uint64_t, std::uint32_t>{handle, 0});
    return it != index_.end() && it->first == handle ? it->second : SIZE_MAX;
}

std::size_t Handles::Find(std::uint64_t handle) const
{
    if (const std::size_t found = FindInFile(handle); found != SIZE_MAX)
        return found;
    const auto added = added_.find(handle);
    if (added != added_.end())
        return added->second;
    const auto madeUp = madeUp_.find(handle);
    return madeUp == madeUp_.end() ? SIZE_MAX : madeUp->second;
}

std::uint64_t Handles::Of(const Sections& records, std::size_t record)
{
    if (records[record].handle != 0)
        return records[record].handle;
    const auto known = madeUpOf_.find(record);
    if (known != madeUpOf_.end())
        return known->second;
    if (next_ == 0)
        return 0;
    const std::uint64_t handle = next_++;
    madeUpOf_[record] = handle;
    madeUp_[handle] = record;
    return handle;
}

std::uint64_t Handles::Add(std::size_t record)
{
    if (next_ == 0)
        return 0;
    const std::uint64_t handle = next_++;
    added_[handle] = record;
    return handle;
}

} // namespace vel::dxf
