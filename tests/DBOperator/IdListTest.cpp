#include "DBOperator/IdList.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace
{

std::string ListText(std::vector<long long> vIds)
{
    return CIdList(static_cast<long>(vIds.size()), vIds.data()).Text();
}

} // namespace

TEST(IdList, WritesTheLow32BitsOfEachIdSigned)
{
    EXPECT_EQ(" in(7)", ListText({7}));
    EXPECT_EQ(" in(1,-2147483648,-1,5)", ListText({1, 0x80000000LL, -1, 0x100000005LL}));
}

// " in(" and 163 ids of ten digits are 1,796 characters: one more id begins, whatever its length,
// and the list ends.
TEST(IdList, StopsBehindTheIdThatReachesTheLimit)
{
    std::vector<long long> vIds(163, 1234567890);
    ASSERT_EQ(1796U + 1, ListText(vIds).size());
    vIds.push_back(-2147483648LL);
    EXPECT_TRUE(CIdList::CanListAll(164, vIds.data()));
    const std::string strFull = ListText(vIds);
    EXPECT_EQ(1796U + 12 + 1, strFull.size());
    EXPECT_EQ(",-2147483648)", strFull.substr(strFull.size() - 13));
    vIds.push_back(1);
    EXPECT_FALSE(CIdList::CanListAll(165, vIds.data()));
    EXPECT_EQ(strFull, ListText(vIds));
}
