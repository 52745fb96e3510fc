// Drives whose media are disc images.
#include "drives/Drives.h"
#include "images/ImageMedium.h"

#include <algorithm>
#include <cstdlib>
#include <filesystem>
#include <string_view>

namespace discio {

namespace fs = std::filesystem;

namespace {

class CImageDrive : public IDrive {
public:
    explicit CImageDrive(const std::string& path) : m_path(path) {}

    std::string getName() const override { return fs::path(m_path).filename(); }
    std::string getPath() const override { return m_path; }
    std::string getRevision() const override { return {}; }
    std::string getDriverDescription() const override { return "disc image"; }
    std::vector<double> getReadSpeeds() const override { return {}; }
    bool checkMedium(int) override {
        std::error_code none;
        return fs::exists(m_path, none);
    }
    std::shared_ptr<IMedium> openMedium() override { return std::make_shared<CImageMedium>(m_path); }
    void moveTray(bool) override { throw CDiscError(DISCIO_ERROR_NOT_SUPPORTED, m_path + " has no tray"); }

protected:
    const std::string m_path;
};

class CFolderDrive : public CImageDrive {
public:
    using CImageDrive::CImageDrive;

    std::string getDriverDescription() const override { return "folder of disc images"; }
    bool checkMedium(int) override { return !findImage().empty(); }
    std::shared_ptr<IMedium> openMedium() override {
        const std::string image = findImage();
        if (image.empty()) throw CDiscError(DISCIO_ERROR_NO_DISC, m_path + " has no complete disc image");
        return std::make_shared<CImageMedium>(image);
    }

private:
    // The first image whose files are all there. Empty if there is none.
    std::string findImage() const {
        std::vector<std::string> names;
        std::error_code error;
        for (auto i = fs::directory_iterator(m_path, error); !error && i != fs::directory_iterator();
             i.increment(error))
            if (isImageName(i->path())) names.push_back(i->path());
        std::sort(names.begin(), names.end());
        const auto isComplete = [](const std::string& name) {
            try {
                readImage(name);
                return true;
            } catch (const CDiscError&) {
                return false; // still being copied, or something else
            }
        };
        const auto found = std::find_if(names.begin(), names.end(), isComplete);
        return found == names.end() ? std::string() : *found;
    }
};

} // namespace

std::shared_ptr<IDrive> createImageDrive(const std::string& path) {
    return std::make_shared<CImageDrive>(path);
}

Drives findFolderDrives() {
    Drives drives;
    const char* value = std::getenv("TONEWRIGHT_DRIVE_FOLDERS");
    std::string_view list = value ? value : "";
    while (!list.empty()) {
        std::string folder(list.substr(0, list.find(':')));
        list.remove_prefix(std::min(list.size(), folder.size() + 1));
        while (folder.size() > 1 && folder.back() == '/') folder.pop_back();
        std::error_code none;
        if (fs::path(folder).is_absolute() && fs::is_directory(folder, none))
            drives.push_back(std::make_shared<CFolderDrive>(folder));
    }
    return drives;
}

} // namespace discio
