#include "zvr_lang_manager/LanguageEntries.h"

#include <utility>

namespace zvr_lang {

CLanguageEntries::CLanguageEntries() : m_buckets(61) {}

CLanguageEntries::~CLanguageEntries() {
    clear();
}

// Node by node: the default destructor would destroy the nodes of a long chain recursively.
void CLanguageEntries::clear() {
    for (std::unique_ptr<SNode>& bucket : m_buckets)
        while (bucket) bucket = std::move(bucket->next);
}

void CLanguageEntries::add(SLanguageEntry entry) {
    if (static_cast<double>(m_count + 1) > 0.8 * static_cast<double>(m_buckets.size())) grow();
    std::unique_ptr<SNode>& bucket = getBucket(*entry.key);
    bucket = std::make_unique<SNode>(SNode{std::move(entry), std::move(bucket)});
    ++m_count;
}

const SLanguageEntry* CLanguageEntries::find(const peru::IString& key) const {
    const SNode* node = m_buckets[key.getHash() % m_buckets.size()].get();
    while (node && !node->entry.key->equals(key)) node = node->next.get();
    return node ? &node->entry : nullptr;
}

void CLanguageEntries::grow() {
    std::vector<std::unique_ptr<SNode>> old(m_buckets.size() * 2 + 1);
    old.swap(m_buckets);
    for (std::unique_ptr<SNode>& chain : old) {
        // From the tail, so that entries with the same key stay in the same order.
        std::vector<std::unique_ptr<SNode>> nodes;
        while (chain) {
            std::unique_ptr<SNode> next = std::move(chain->next);
            nodes.push_back(std::move(chain));
            chain = std::move(next);
        }
        for (; !nodes.empty(); nodes.pop_back()) {
            std::unique_ptr<SNode>& bucket = getBucket(*nodes.back()->entry.key);
            nodes.back()->next = std::move(bucket);
            bucket = std::move(nodes.back());
        }
    }
}

} // namespace zvr_lang
