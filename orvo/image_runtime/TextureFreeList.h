#pragma once

#include <cstddef>
#include <iterator>
#include <list>
#include <map>
#include <tuple>

namespace ORVO {

/// Textures of one kind that nobody uses, oldest first, with an index by size and format: the first that
/// matches is found without a walk over the list. Owns nothing by itself: who puts a texture in or takes it
/// out owns it then.
///
/// Threads: one at a time.
template <typename TextureT>
class TextureFreeList {
public:
    /// What two textures have in common that may stand in for each other. Absent dimensions are 1.
    struct Key {
        std::size_t nWidth_;
        std::size_t nHeight_;
        std::size_t nDepth_;
        int nFormat_;

        friend bool operator<(Key const& a, Key const& b) noexcept {
            return std::tie(a.nWidth_, a.nHeight_, a.nDepth_, a.nFormat_) <
                   std::tie(b.nWidth_, b.nHeight_, b.nDepth_, b.nFormat_);
        }
    };

    /// A texture with the bytes that it is counted with.
    struct Entry {
        TextureT* pTexture_;
        std::size_t nBytes_;
    };

    bool empty() const noexcept { return oEntries_.empty(); }
    std::size_t size() const noexcept { return oEntries_.size(); }

    /// Puts a texture behind all others. Strong guarantee: if memory fails, the list is as it was.
    void pushBack(Key const& key, Entry const& entry) {
        oEntries_.push_back(Node{entry, {}});
        auto const node = std::prev(oEntries_.end());
        try {
            // Equal keys stay in the order in which they came.
            node->oPlace_ = oIndex_.emplace(key, node);
        } catch (...) {
            oEntries_.pop_back();
            throw;
        }
    }

    /// The oldest texture with this key, which stays in the list; null if there is none.
    TextureT* firstMatch(Key const& key) const {
        auto const place = oIndex_.find(key);
        return place != oIndex_.end() ? oIndex_.lower_bound(key)->second->oEntry_.pTexture_ : nullptr;
    }

    /// Takes the oldest texture with this key out of the list, which must hold one.
    Entry takeFirstMatch(Key const& key) noexcept { return take(oIndex_.lower_bound(key)->second); }

    /// Takes the oldest texture out of the list, which must not be empty.
    Entry takeFront() noexcept { return take(oEntries_.begin()); }

private:
    struct Node;
    using Nodes = std::list<Node>;
    using Index = std::multimap<Key, typename Nodes::iterator>;
    struct Node {
        Entry oEntry_;
        typename Index::iterator oPlace_;
    };

    Entry take(typename Nodes::iterator node) noexcept {
        Entry const entry = node->oEntry_;
        oIndex_.erase(node->oPlace_);
        oEntries_.erase(node);
        return entry;
    }

    Nodes oEntries_;
    Index oIndex_;
};

} // namespace ORVO
