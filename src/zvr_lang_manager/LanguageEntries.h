// The texts of a loaded language file.
#pragma once

#include "peru/strings/String.h"
#include "zvr_lang_manager/Api.h"

#include <memory>
#include <vector>

namespace zvr_lang {

// An entry of a "data" chunk; the strings are stored in this order.
struct SLanguageEntry {
    // Set in `flags`: the translation is a draft and is not used.
    static constexpr uint32_t kUnfinished = 1;

    uint32_t flags = 0;
    peru::P<peru::IString> key;
    peru::P<peru::IString> text;        // the translation
    peru::P<peru::IString> defaultText; // the English text that was translated
    peru::P<peru::IString> comment;     // for translators
};

// A hash table with chaining. Of several entries with the same key the one added last counts.
class ZVR_LANG_API CLanguageEntries {
public:
    CLanguageEntries();
    ~CLanguageEntries();
    CLanguageEntries(const CLanguageEntries&) = delete;
    CLanguageEntries& operator=(const CLanguageEntries&) = delete;

    void add(SLanguageEntry entry);
    const SLanguageEntry* find(const peru::IString& key) const; // null if there is none
    size_t getCount() const { return m_count; }

    // In no particular order; of entries with the same key only the one that counts.
    template <class F> void forEach(F&& visit) const {
        for (const std::unique_ptr<SNode>& bucket : m_buckets)
            for (const SNode* node = bucket.get(); node; node = node->next.get())
                if (find(*node->entry.key) == &node->entry) visit(node->entry);
    }

private:
    struct SNode {
        SLanguageEntry entry;
        std::unique_ptr<SNode> next;
    };

    void clear();
    void grow();
    std::unique_ptr<SNode>& getBucket(const peru::IString& key) {
        return m_buckets[key.getHash() % m_buckets.size()];
    }

    std::vector<std::unique_ptr<SNode>> m_buckets;
    size_t m_count = 0;
};

} // namespace zvr_lang
