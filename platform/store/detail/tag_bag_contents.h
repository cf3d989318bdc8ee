#pragma once

#include "platform/store/detail/object_store_writer.h"
#include "platform/store/tag_bag.h"

#include <list>
#include <unordered_map>

/// What a bag holds.
///
/// An object's bytes are in memory (in the image of the file that was read, or copied out of it), or known to
/// lie in the file `source`, or both, or nowhere. They are dropped from memory as soon as a live object was
/// made from them and the file has them too; an object made from a large image may go on using them there.
class TagBag::Contents {
public:
    struct Entry {
        String name;
        String layer;
        uint8_t major = 0;
        uint8_t minor = 0;
        std::unique_ptr<Streamable> owned;
        Taggable* tagged = nullptr; ///< the other side of `owned`
        const Streamable* lent = nullptr;
        /// The live object differs from the bytes, or did when it was last here. Cleared by a flush only.
        bool changed = false;
        bool inMemory = false;
        bool onFile = false; ///< `place` tells where in `source`
        Qx::detail::StoredPlace place;
        std::span<const std::byte> memory;
        std::vector<std::byte> copied; ///< backs `memory` once the image was dropped
        /// Keeps `memory`, with the image or without, if it is a large part of a large image.
        std::shared_ptr<const void> keeper;

        [[nodiscard]] bool hasBytes() const { return inMemory || onFile; }
        [[nodiscard]] bool isInImage() const { return inMemory && copied.empty() && keeper == nullptr; }
        [[nodiscard]] const Streamable* live() const { return lent != nullptr ? lent : owned.get(); }
        [[nodiscard]] bool isChanged() const {
            return changed || (lent == nullptr && tagged != nullptr && tagged->isTagChanged());
        }
        [[nodiscard]] bool mustBePacked() const { return live() != nullptr && (isChanged() || !hasBytes()); }
        /// Makes an object the one that the bag owns under the name. `isNew` tells that its bytes are none.
        void own(std::unique_ptr<Streamable> object, bool isNew);
        [[nodiscard]] Qx::detail::StoredLabel label() const { return {name, layer, major, minor}; }
    };
    using Entries = std::list<Entry>;

    /// Forgets everything but the identity of the store.
    void clear();
    [[nodiscard]] Entry* find(std::string_view name);
    [[nodiscard]] const Entry* find(std::string_view name) const;
    Entry& findOrAdd(std::string_view name);
    void erase(std::string_view name);
    /// False when there is no such object or the new name is taken.
    bool rename(std::string_view name, std::string_view newName);
    /// The entry at a place in the order of the file; null beyond the end.
    [[nodiscard]] Entry* at(size_t index);
    /// Adds the objects of the image. `complaints` is empty or tells of each whether it is sound; those that
    /// are not are left out.
    void takeImage(std::span<const Qx::detail::StoredObject> objects, std::span<const String> complaints,
                   bool onFile);

    /// An object's bytes, in `reread` if they had to be read from the file. False with `objectStatus` set.
    bool bytesOf(const Entry& entry, std::vector<std::byte>& reread, std::span<const std::byte>& bytes);
    /// Unpacks an object's bytes. False with `objectStatus` set.
    bool unpack(const Entry& entry, Streamable& object);
    /// A live object from an object's bytes; null with `objectStatus` set.
    std::unique_ptr<Streamable> build(const Entry& entry);
    /// A failure if a later version of this program wrote the object, whose class writes `current` here.
    [[nodiscard]] Qx::Status checkRevision(const Entry& entry, uint8_t current) const;
    /// Forgets an object's bytes in memory if the file has them.
    void dropMemory(Entry& entry);
    /// Forgets an object's bytes wherever they are.
    void forgetBytes(Entry& entry);
    /// Takes the live object out of an entry, if the bag owns one there.
    std::unique_ptr<Streamable> takeOwned(Entry& entry);

    [[nodiscard]] String path() const;
    /// Writes the file once. `retry` is set when bytes could not be taken over from `source`: then nothing
    /// was changed and `keepFromSource` must be false the next time.
    Qx::Status write(bool keepFromSource, bool& retry);

    cookie id;
    String folder;
    String extension;
    bool isOpen = false;
    Qx::Status openStatus;
    OpenResult lastResult = Missing;
    Qx::Status objectStatus;
    size_t numPacked = 0;
    size_t numKept = 0;
    std::shared_ptr<TagBagLife> life;
    Entries entries; ///< in the order of the file
    Qx::detail::StoreImage image;
    Qx::detail::StoreIdentity source;

private:
    struct Written;
    Qx::Status writeEntry(Qx::detail::StoreWriter& writer, Entry& entry, Written& written,
                          Qx::detail::StoreSource* from, bool& intact);
    void thinImage();
    void adopt(std::vector<Written>& written, Qx::detail::StoreIdentity& identity, bool durable);

    std::unordered_map<std::string_view, Entries::iterator> m_index; ///< keys lie in the entries
    std::vector<Entry*> m_order; ///< the entries by their place; stale unless as long as `entries`
    size_t m_imageBytes = 0;     ///< of the objects that lay in the image, those kept apart left out
    size_t m_imageBytesInUse = 0;
};
