#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <map>
#include <memory>
#include <mutex>
#include <tuple>
#include <unordered_map>

namespace ORVO::ColourEngine::Internal {

enum class HandleKind { Profile, Transform, Shader, String, StringAtom, Error };
constexpr std::size_t nHandleKinds = 6;

/// All objects that the engine has handed out, with their reference counts. A handle is a number dressed as a
/// pointer: it is never dereferenced, never given to a second object, and one that was dropped is told from
/// one that lives. So a client that keeps a handle too long gets a failure, and never another object.
///
/// Threads: any.
class HandleTable {
public:
    /// What makes two transforms the same: the serials of both profiles, intent, options.
    using InternKey = std::tuple<std::uint64_t, std::uint64_t, std::uint32_t, std::uint32_t>;

    /// The engine's table; never destroyed, because hosts drop handles in static destructors.
    static HandleTable& instance();

    /// A new handle with one reference.
    void* add(HandleKind eKind, std::shared_ptr<void const> spObject);
    /// A new handle that references neither keep nor drop: for objects of the engine's own. It is not
    /// counted.
    void* addPermanent(HandleKind eKind, std::shared_ptr<void const> spObject);
    /// The live handle of this key with one reference more; null if there is none.
    void* findInterned(InternKey const& key);
    /// The same, but a new handle for the object where there is none.
    void* intern(HandleKind eKind, InternKey const& key, std::shared_ptr<void const> spObject);

    /// False for what is no live handle of this kind.
    bool addReference(void* pHandle, HandleKind eKind);
    /// Drops a reference, and the object with the last one. False for what is no live handle of this kind.
    bool release(void* pHandle, HandleKind eKind);

    /// The object of a handle, kept alive by the result; null for what is no live handle of this kind.
    template <typename Object>
    std::shared_ptr<Object const> find(void* pHandle, HandleKind eKind) {
        return std::static_pointer_cast<Object const>(findObject(pHandle, eKind));
    }

    std::size_t count(HandleKind eKind);
    std::uint64_t countReferences();

private:
    struct Entry {
        HandleKind eKind_;
        std::shared_ptr<void const> spObject_;
        std::uint64_t nReferences_;
        bool bPermanent_;
        InternKey const* pKey_; ///< in aInterned_, null where it is not interned
    };

    void* addEntry(Entry entry);
    Entry* findEntry(void* pHandle, HandleKind eKind);
    std::shared_ptr<void const> findObject(void* pHandle, HandleKind eKind);

    std::mutex oLock_;
    std::unordered_map<std::uintptr_t, Entry> aEntries_;
    std::map<InternKey, std::uintptr_t> aInterned_;
    std::array<std::size_t, nHandleKinds> aCounts_{};
    std::uintptr_t iLast_ = 0;
};

} // namespace ORVO::ColourEngine::Internal
