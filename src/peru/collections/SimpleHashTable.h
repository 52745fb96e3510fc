// A hash table with string keys.
#pragma once

#include "peru/strings/IString.h"

#include <cstddef>
#include <cstdint>
#include <memory>
#include <utility>
#include <vector>

namespace peru {

// K is a string handle. Equal texts are the same key, whatever their encodings. A value keeps its address
// until it is removed. Not thread-safe.
template <class K, class V> class TSimpleHashTable {
public:
    explicit TSimpleHashTable(size_t size = 17) : m_slots(size > 0 ? size : 1) {}
    TSimpleHashTable(const TSimpleHashTable&) = delete;
    TSimpleHashTable& operator=(const TSimpleHashTable&) = delete;
    // Node by node: the default destructor would destroy the nodes of a long chain recursively.
    ~TSimpleHashTable() { clear(); }

    // Returns null if the key is missing.
    V* find(const IString& key) const {
        const std::unique_ptr<SNode>& node = *getLink(m_slots, key.getHash(), key);
        return node ? &node->value : nullptr;
    }
    // The same for text that is no string object, with its hash.
    V* find(uint32_t hash, const CStringArg& key) const {
        const std::unique_ptr<SNode>& node = *getLink(m_slots, hash, key);
        return node ? &node->value : nullptr;
    }

    // Inserts the value or replaces the existing one, whose key is kept.
    V& set(const K& key, V value) {
        if (V* known = find(*key)) return *known = std::move(value);
        if (m_count >= m_slots.size()) grow();
        std::unique_ptr<SNode>& slot = m_slots[key->getHash() % m_slots.size()];
        slot = std::make_unique<SNode>(key->getHash(), key, std::move(value), std::move(slot));
        ++m_count;
        return slot->value;
    }

    // Returns whether the key existed.
    bool remove(const IString& key) {
        std::unique_ptr<SNode>* link = getLink(m_slots, key.getHash(), key);
        if (!*link) return false;
        std::unique_ptr<SNode> removed = std::move(*link);
        *link = std::move(removed->next);
        --m_count;
        return true;
    }

    void clear() {
        for (std::unique_ptr<SNode>& slot : m_slots)
            while (slot) slot = std::move(slot->next);
        m_count = 0;
    }

    size_t getCount() const { return m_count; }

    // Calls `visit` with each key and value, in no particular order; it must not change the table.
    template <class F> void forEach(F&& visit) const {
        for (const std::unique_ptr<SNode>& slot : m_slots)
            for (SNode* node = slot.get(); node; node = node->next.get())
                visit(std::as_const(node->key), node->value);
    }

private:
    struct SNode {
        SNode(uint32_t h, const K& k, V&& v, std::unique_ptr<SNode>&& n)
            : hash(h), key(k), value(std::move(v)), next(std::move(n)) {}
        uint32_t hash;
        K key;
        V value;
        std::unique_ptr<SNode> next;
    };
    using Slots = std::vector<std::unique_ptr<SNode>>;

    // The link to the key's node, or the empty link at the end of its chain. Texts are only compared if the
    // hashes are equal.
    template <class S> static auto* getLink(S& slots, uint32_t hash, const CStringArg& key) {
        auto* link = &slots[hash % slots.size()];
        while (*link && !((*link)->hash == hash && (*link)->key->equals(key))) link = &(*link)->next;
        return link;
    }

    void grow() {
        Slots slots(m_slots.size() * 2 + 1);
        for (std::unique_ptr<SNode>& slot : m_slots) {
            while (slot) {
                std::unique_ptr<SNode> node = std::move(slot);
                slot = std::move(node->next);
                std::unique_ptr<SNode>& target = slots[node->hash % slots.size()];
                node->next = std::move(target);
                target = std::move(node);
            }
        }
        m_slots.swap(slots);
    }

    Slots m_slots;
    size_t m_count = 0;
};

} // namespace peru
