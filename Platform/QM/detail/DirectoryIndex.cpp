#include "QM/detail/DirectoryIndex.h"

namespace QM {
namespace detail {

void DirectoryIndex::Unlink(Entry& ioEntry) {
    (ioEntry.older ? ioEntry.older->newer : mOldest) = ioEntry.newer;
    (ioEntry.newer ? ioEntry.newer->older : mNewest) = ioEntry.older;
}

void DirectoryIndex::LinkNewest(Entry& ioEntry) {
    ioEntry.older = mNewest;
    ioEntry.newer = nullptr;
    (mNewest ? mNewest->newer : mOldest) = &ioEntry;
    mNewest = &ioEntry;
}

bool DirectoryIndex::Touch(const EntryKey& inKey) {
    const auto found = mEntries.find(inKey);
    if (found == mEntries.end()) {
        return false;
    }
    Unlink(found->second);
    LinkNewest(found->second);
    return true;
}

void DirectoryIndex::Insert(const EntryKey& inKey, const FileState& inFile) {
    const auto inserted = mEntries.try_emplace(inKey);
    Entry& entry = inserted.first->second;
    if (inserted.second) {
        entry.key = &inserted.first->first;
    } else {
        Unlink(entry);
        mBytes -= entry.file.size;
    }
    entry.file = inFile;
    mBytes += inFile.size;
    LinkNewest(entry);
}

bool DirectoryIndex::Remove(const EntryKey& inKey) {
    const auto found = mEntries.find(inKey);
    if (found == mEntries.end()) {
        return false;
    }
    Unlink(found->second);
    mBytes -= found->second.file.size;
    mEntries.erase(found);
    return true;
}

bool DirectoryIndex::TakeOldest(EntryKey& outKey, std::uint64_t& outSize) {
    if (!mOldest) {
        return false;
    }
    outKey = *mOldest->key;
    outSize = mOldest->file.size;
    return Remove(outKey);
}

const FileState* DirectoryIndex::Find(const EntryKey& inKey) const {
    const auto found = mEntries.find(inKey);
    return found == mEntries.end() ? nullptr : &found->second.file;
}

std::uint64_t DirectoryIndex::SizeOf(const EntryKey& inKey) const {
    const FileState* const file = Find(inKey);
    return file ? file->size : 0;
}

}  // namespace detail
}  // namespace QM
