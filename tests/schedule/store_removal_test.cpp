// Removing articles from the store by identity: every group that lists them forgets
// them, look-alikes stay, and pointers the store does not hold are ignored.
#include "schedule/schedule_store.hpp"

#include <gtest/gtest.h>

namespace {

CZodEVIArticle* Add(CZodEVIBdr& bdr, const std::string& groupKey, const std::string& treePath)
{
    auto article = std::make_unique<CZodEVIArticle>();
    article->groupKey = groupKey;
    article->treePath = treePath;
    article->number = bdr.TakeNextNumber();
    CZodEVIArticle* added = bdr.AddArticle(std::move(article));
    bdr.GroupOf(groupKey, true)->push_back(added);
    return added;
}

TEST(CZodEVIBdr, RemoveArticlesTakesExactlyTheGivenArticles)
{
    CZodEVIBdr bdr;
    CZodEVIArticle* a = Add(bdr, "PRJ_RES(EU 1)", "EU 1\\\\X-001 - a");
    CZodEVIArticle* twin = Add(bdr, "PRJ_RES(eu 1)", "eu 1\\\\x-001 - A");
    CZodEVIArticle* b = Add(bdr, "PRJ_RES(EU 1)", "EU 1\\\\X-002 - b");
    // An article listed by a group other than that of its key is forgotten there too.
    bdr.GroupOf("autre", true)->push_back(b);
    CZodEVIArticle stranger;

    EXPECT_EQ(bdr.RemoveArticles({}), 0u);
    EXPECT_EQ(bdr.RemoveArticles({twin, b, b, &stranger}), 2u);
    ASSERT_EQ(bdr.Articles().size(), 1u);
    EXPECT_EQ(bdr.Articles()[0].get(), a);
    EXPECT_EQ(*bdr.GroupOf("PRJ_RES(EU 1)", false), CZodEVIGroup{a});
    EXPECT_TRUE(bdr.GroupOf("PRJ_RES(eu 1)", false)->empty());
    EXPECT_TRUE(bdr.GroupOf("autre", false)->empty());
    EXPECT_EQ(bdr.RemoveArticles({&stranger}), 0u);
    EXPECT_EQ(bdr.Articles().size(), 1u);
}

} // namespace
