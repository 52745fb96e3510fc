// A disc that is composed in memory and then written to an image or to a drive.
#pragma once

#include "library/DiscLibrary.h"
#include "library/Library.h"

#include <filesystem>
#include <functional>
#include <string>
#include <vector>

namespace host {

enum class EDiscContent { audio, data };

struct SWriteSettings {
    uint32_t flags = 0; // DISCIO_WRITE_ values
    double speed = 0;   // 0: the fastest
};

// All functions throw std::runtime_error with the reason unless documented otherwise.
class CDiscProject {
public:
    explicit CDiscProject(EDiscContent content);

    // Appends a track. The source must deliver the samples of a CD.
    void addTrack(CLibrary& library, const CHandle& source);
    // The silence before a track, from 0.
    void setGap(int track, double seconds);
    // DISCIO_TEXT_TITLE and so on, of a track or with -1 of the disc. The part of the text that a disc can
    // hold is set.
    void setText(int track, int32_t text, const std::string& value);
    int getTrackCount() const;
    int32_t getLengthBlocks() const; // up to the lead-out

    void setTitle(const std::string& title);
    // Names in UTF-8, from the outermost folder to the entry.
    using Path = std::vector<std::string>;
    void addFolder(const Path& path);
    void addFile(const Path& path, const std::filesystem::path& source);

    // Receives values from 0.0 to 1.0 that never decrease; returns whether to continue.
    using Progress = std::function<bool(double)>;
    // False if the progress function ended it.
    bool writeImage(const std::filesystem::path& image, const SWriteSettings& settings,
                    const Progress& progress);
    bool writeDisc(DISCIO_Drive* drive, const SWriteSettings& settings, const Progress& progress);
    // Whether the last write ended while the drive or the image was being written.
    bool isPartlyWritten() const { return m_isPartlyWritten; }

private:
    struct SRunning;
    template <class Write>
    bool write(const SWriteSettings& settings, const Progress& progress, Write&& write);

    CHandle m_handle;
    DISCIO_Project* m_project = nullptr; // belongs to the handle
    DiscHandle<DISCIO_Disc> m_disc;
    bool m_isPartlyWritten = false;
};

} // namespace host
