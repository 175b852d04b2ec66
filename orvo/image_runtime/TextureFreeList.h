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

    bool empty() const noexcept { return oNodes_.empty(); }
    std::size_t size() const noexcept { return oNodes_.size(); }

    /// Puts a texture behind all others. Strong guarantee: if memory fails, the list is as it was.
    void pushBack(Key const& key, TextureT* pTexture) {
        oNodes_.push_back(Node{pTexture, oIndex_.end()});
        auto const node = std::prev(oNodes_.end());
        try {
            // Equal keys stay in the order in which they come.
            node->oPlace_ = oIndex_.emplace(key, node);
        } catch (...) {
            oNodes_.pop_back();
            throw;
        }
    }

    /// Takes the oldest texture with this key out of the list, after the given code has seen it; if that
    /// throws, the texture stays. Null if there is none.
    template <typename Prepare>
    TextureT* takeFirstMatch(Key const& key, Prepare const& prepare) {
        auto const place = oIndex_.lower_bound(key);
        if (place == oIndex_.end() || key < place->first)
            return nullptr;
        prepare(*place->second->pTexture_);
        return take(place->second);
    }

    /// Takes the oldest texture out of the list; null if it is empty.
    TextureT* takeFront() noexcept { return oNodes_.empty() ? nullptr : take(oNodes_.begin()); }

private:
    struct Node;
    using Nodes = std::list<Node>;
    using Index = std::multimap<Key, typename Nodes::iterator>;
    struct Node {
        TextureT* pTexture_;
        typename Index::iterator oPlace_;
    };

    TextureT* take(typename Nodes::iterator node) noexcept {
        TextureT* const pTexture = node->pTexture_;
        oIndex_.erase(node->oPlace_);
        oNodes_.erase(node);
        return pTexture;
    }

    Nodes oNodes_;
    Index oIndex_;
};

} // namespace ORVO
