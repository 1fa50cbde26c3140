// Articles put in a schedule store as the updates put them: stored, then filed in the
// group of their key.
#pragma once

#include <memory>

#include "schedule/schedule_store.hpp"

// Stores a copy of `fields` and files it in its group (none for an empty key).
inline CZodEVIArticle* AddFiled(zodevi::CZodEVIBdr& bdr, CZodEVIArticle fields)
{
    CZodEVIArticle* added = bdr.AddArticle(std::make_unique<CZodEVIArticle>(std::move(fields)));
    if (!added->groupKey.empty())
        bdr.GroupOf(added->groupKey, true)->push_back(added);
    return added;
}
