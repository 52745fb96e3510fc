// What a project stores beside its XML: pictures, texts and other data.
#pragma once

#include "ced/Project.h"
#include "peru/MemoryManager.h"

#include <functional>
#include <string>

namespace host::covers {

using peru::P;

struct SAttachment {
    std::string name;            // "image0.jpg", different for each attachment
    std::string kind;            // "image", "text" or "memory"
    P<peru::IMemoryBlock> bytes; // as stored; empty if the attachment is missing or damaged
};

// Calls the function for each attachment of a file, whose bytes and project the caller has read, one after
// the other, so that only one of them is in memory. Attachments that elements share come once.
void forEachAttachment(const ced::CProject& project, std::string bytes,
                       const std::function<void(const SAttachment&)>& use);

} // namespace host::covers
