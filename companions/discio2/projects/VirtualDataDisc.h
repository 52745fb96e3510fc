// A data disc that is being composed.
#pragma once

#include "data/DataVolume.h"
#include "projects/VirtualDisc.h"

#include <map>

namespace discio {

class CVirtualDataDisc : public CVirtualDisc, public IDataVolume {
public:
    struct SNode {
        SDataEntry entry;
        std::map<std::string, std::unique_ptr<SNode>, std::less<>> children; // of a folder
    };

    CVirtualDataDisc();

    const STableOfContents& getContents() const override { return m_contents; }
    SMediumState getState() const override;
    bool hasComponent(bool isAudio) const override { return !isAudio; }
    std::unique_ptr<IAudioReader> createAudioReader(const STrack& track) const override;
    std::string getDataPath() const override;

    std::string getTitle() override { return m_title; }
    std::vector<SDataEntry> list(const DataPath& folder) override;
    std::optional<SDataEntry> find(const DataPath& folder, const std::string& name) override;

    const SNode& getRoot() const { return m_root; }
    // These throw CDiscError and then change nothing. Paths have "\" or "/" between their names; sources are
    // paths of files.
    void setTitle(const std::string& title);
    void addFile(const std::string& path, const std::string& source);
    void createFolder(const std::string& path);
    void remove(const std::string& path);

private:
    // The folder that contains the last name of a path.
    SNode& requireParent(const std::string& path, std::string& name);
    SNode& requireFolder(const DataPath& folder);
    void add(const std::string& path, SDataEntry entry);

    SNode m_root;
    std::string m_title;
    STableOfContents m_contents; // one data track as long as the files
    int64_t m_blocks = 0;        // of the files
};

} // namespace discio
