#pragma once

#include "orvo/core/Export.h"

#include <cstddef>
#include <list>

namespace ORVO {

namespace OGL {
class Buffer;
}

/// The buffers through which uploads go, in order of last use, each with the query that tells whether the
/// driver has done with it. A buffer is taken, filled, transferred and given back before the next is taken;
/// where a second one is taken meanwhile, it is to be given back first.
///
/// Queries belong to the context in which they are begun, and only one is active at a time: the queue never
/// asks for a query of another context, never for one that is active, and never begins one beside somebody
/// else's.
///
/// Threads: one at a time, with a context current that shares with the others in use.
class ORVO_API PBOQueue {
public:
    PBOQueue();
    /// The queue must have been cleared, while a context of the share group is current.
    ~PBOQueue();
    PBOQueue(PBOQueue const&) = delete;
    PBOQueue& operator=(PBOQueue const&) = delete;

    /// As TexturePool::getPBOFromQueue().
    OGL::Buffer* take(unsigned sizeInBytes, unsigned queryID);
    /// As TexturePool::returnPBOToQueue().
    void giveBack(OGL::Buffer* pBuffer);

    /// Deletes the queries that belong to the current context, the active one too. Nothing if none is
    /// current.
    void deleteQueries() noexcept;
    /// Deletes all buffers, in use or not.
    void clear() noexcept;

    /// Buffers of the queue, in use or not, and their bytes.
    std::size_t size() const noexcept { return oEntries_.size(); }
    std::size_t bytes() const noexcept { return nPBOBytes_; }

private:
    struct Entry {
        OGL::Buffer* pBuffer_; ///< owned.
        unsigned nQuery_;      ///< the taker's.
        bool bOutstanding_;    ///< taken and not given back.
        bool bBegun_;          ///< whether the query was begun, and not left out beside another one.
        void const* pContext_; ///< handle of the context in which it was taken.
    };
    using Entries = std::list<Entry>;

    Entries::iterator findFree(unsigned sizeInBytes);
    Entries::iterator append(unsigned sizeInBytes);
    /// Begins the query of an entry that is not yet in the queue, unless somebody else's is active. A failed
    /// one throws ExceptionOGL and leaves the entry's buffer free.
    void beginQuery(Entry& entry);
    void enforceBudget();
    void remove(Entries::iterator entry) noexcept;
    bool isQueueQuery(unsigned nQuery) const noexcept;
    static bool isOfCurrentContext(Entry const& entry) noexcept;

    Entries oEntries_;
    std::size_t nPBOBytes_ = 0;
};

} // namespace ORVO
