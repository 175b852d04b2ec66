#include "orvo/image_runtime/TextureFreeList.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <list>
#include <random>
#include <stdexcept>
#include <vector>

namespace ORVO {
namespace {

struct FakeTexture {
    std::size_t nWidth_ = 0;
    std::size_t nHeight_ = 1;
    std::size_t nDepth_ = 1;
    int nFormat_ = 0;
};

using FreeList = TextureFreeList<FakeTexture>;

FreeList::Key keyOf(FakeTexture const& texture) {
    return {texture.nWidth_, texture.nHeight_, texture.nDepth_, texture.nFormat_};
}

auto const keep = [](FakeTexture&) {};

/// What the index stands for: a list that is walked from its front for the first texture that matches.
class PlainList {
public:
    void pushBack(FakeTexture* pTexture) { vpTexture_.push_back(pTexture); }

    FakeTexture* takeFirstMatch(FreeList::Key const& key) {
        for (auto place = vpTexture_.begin(); place != vpTexture_.end(); ++place) {
            FakeTexture* const p = *place;
            if (p->nWidth_ == key.nWidth_ && p->nHeight_ == key.nHeight_ && p->nDepth_ == key.nDepth_ &&
                p->nFormat_ == key.nFormat_) {
                vpTexture_.erase(place);
                return p;
            }
        }
        return nullptr;
    }

    FakeTexture* takeFront() {
        if (vpTexture_.empty())
            return nullptr;
        FakeTexture* const pTexture = vpTexture_.front();
        vpTexture_.pop_front();
        return pTexture;
    }

    std::size_t size() const { return vpTexture_.size(); }

private:
    std::list<FakeTexture*> vpTexture_;
};

TEST(TextureFreeList, AnswersAsAWalkOverTheList) {
    std::mt19937 random(20240229);
    auto const pick = [&random](unsigned n) {
        return std::uniform_int_distribution<unsigned>(0, n - 1)(random);
    };
    std::vector<FakeTexture> aTextures(400);
    for (FakeTexture& texture : aTextures)
        texture = {pick(3), pick(3), pick(2), static_cast<int>(pick(2))};
    std::vector<FakeTexture*> vpInUse;
    for (FakeTexture& texture : aTextures)
        vpInUse.push_back(&texture);

    FreeList list;
    PlainList plain;
    std::size_t nHits = 0;
    for (int i = 0; i < 20000; ++i) {
        unsigned const action = pick(5);
        if (action < 2 && !vpInUse.empty()) {
            std::swap(vpInUse[pick(static_cast<unsigned>(vpInUse.size()))], vpInUse.back());
            list.pushBack(keyOf(*vpInUse.back()), vpInUse.back());
            plain.pushBack(vpInUse.back());
            vpInUse.pop_back();
            continue;
        }
        FreeList::Key const key{pick(3), pick(3), pick(2), static_cast<int>(pick(2))};
        FakeTexture* const pExpected = action < 4 ? plain.takeFirstMatch(key) : plain.takeFront();
        ASSERT_EQ(pExpected, action < 4 ? list.takeFirstMatch(key, keep) : list.takeFront());
        ASSERT_EQ(plain.size(), list.size());
        ASSERT_EQ(plain.size() == 0, list.empty());
        if (pExpected) {
            vpInUse.push_back(pExpected);
            ++nHits;
        }
    }
    EXPECT_LT(5000u, nHits);
}

TEST(TextureFreeList, IsEmptyAtFirst) {
    FreeList list;
    EXPECT_TRUE(list.empty());
    EXPECT_EQ(0u, list.size());
    EXPECT_EQ(nullptr, list.takeFront());
    EXPECT_EQ(nullptr, list.takeFirstMatch({1, 1, 1, 0}, keep));
}

TEST(TextureFreeList, TellsEveryPartOfTheKeyApart) {
    FakeTexture texture{2, 3, 4, 5};
    FreeList list;
    list.pushBack(keyOf(texture), &texture);
    FreeList::Key const others[] = {{1, 3, 4, 5}, {3, 3, 4, 5}, {2, 2, 4, 5}, {2, 4, 4, 5},
                                    {2, 3, 3, 5}, {2, 3, 5, 5}, {2, 3, 4, 4}, {2, 3, 4, 6}};
    for (FreeList::Key const& key : others)
        EXPECT_EQ(nullptr, list.takeFirstMatch(key, keep));
    EXPECT_EQ(&texture, list.takeFirstMatch({2, 3, 4, 5}, keep));
}

TEST(TextureFreeList, KeepsATextureThatCannotBePrepared) {
    FakeTexture texture{2, 3, 4, 5};
    FreeList list;
    list.pushBack(keyOf(texture), &texture);
    auto const fail = [&texture](FakeTexture& seen) {
        EXPECT_EQ(&texture, &seen);
        throw std::runtime_error("no");
    };
    EXPECT_THROW(list.takeFirstMatch({2, 3, 4, 5}, fail), std::runtime_error);
    EXPECT_EQ(1u, list.size());
    EXPECT_EQ(&texture, list.takeFirstMatch({2, 3, 4, 5}, keep));
    EXPECT_TRUE(list.empty());
}

} // namespace
} // namespace ORVO
