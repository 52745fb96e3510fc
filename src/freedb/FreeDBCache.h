// Replies on the disk.
#pragma once

#include "peru/Object.h"
#include "peru/uri/IURI.h"

#include <optional>
#include <string>

namespace freedb {

using peru::P;

struct SCachedReply {
    std::string charset; // as the server stated it; may be empty
    std::string text;
};

// One file per request in a folder, which is created when needed. A cache never fails: an entry that is
// damaged or belongs to another request does not exist, and one that cannot be written is not stored. Entries
// are replaced atomically, so several processes may share a folder.
class CFreeDBCache : public peru::CObject {
public:
    explicit CFreeDBCache(const P<peru::IURI>& folder); // ends in "/"
    ~CFreeDBCache() override;

    // `server` and `request` identify an entry; `name` begins the name of its file.
    std::optional<SCachedReply> find(const std::string& name, const std::string& server,
                                     const std::string& request) const;
    void store(const std::string& name, const std::string& server, const std::string& request,
               const SCachedReply& reply) const;

private:
    P<peru::IURI> getFile(const std::string& name, const std::string& key) const;

    P<peru::IURI> m_folder;
};

} // namespace freedb
