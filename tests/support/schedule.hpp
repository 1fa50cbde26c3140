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

// One article in one line: the fields the dialogs, filters and estimates look at.
inline CZodEVIArticle* AddFiled(zodevi::CZodEVIBdr& bdr, const std::string& groupKey, const std::string& treePath,
                                int nature, const std::string& designation, const std::string& unit = "",
                                const std::string& quantityKey = "", double unitPrice = 0)
{
    return AddFiled(bdr, {.unitPrice = unitPrice,
                          .nature = nature,
                          .designation = designation,
                          .unit = unit,
                          .quantityKey = quantityKey,
                          .groupKey = groupKey,
                          .treePath = treePath});
}
