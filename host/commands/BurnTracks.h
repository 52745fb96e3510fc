// The files that become the tracks of an audio CD.
#pragma once

#include "media/DiscProject.h"
#include "media/InputContent.h"

#include <list>
#include <string>
#include <utility>
#include <vector>

namespace host {

// Has to outlive the project.
class CBurnTracks {
public:
    // Adds a file as the last track, converted where necessary. Throws std::runtime_error with the reason.
    void add(CLibrary& library, CDiscProject& project, const std::filesystem::path& file);
    // Sets the texts of tracks and disc from the files' tags. A track without a title gets the name of its
    // file; the title of the disc is `title`, or otherwise the album that all tracks have in common. Returns
    // the files whose tags cannot be read, with the reasons.
    std::vector<std::pair<std::filesystem::path, std::string>> setTexts(CDiscProject& project,
                                                                        const std::string& title) const;
    // Of the decoders, such as clipping; one per line, with the names of the files.
    std::vector<std::string> takeWarnings();

private:
    struct STrack {
        explicit STrack(const std::filesystem::path& input) : file(input), content(input) {}
        std::filesystem::path file;
        CInputContent content;
        CHandle source;
    };
    void addLast(CLibrary& library, CDiscProject& project);

    std::list<STrack> m_tracks;
};

} // namespace host
