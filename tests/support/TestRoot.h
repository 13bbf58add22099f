// TestRoot: a device of its own for one test: a fresh folder that is VANTOR_PIM_SYNC_ROOT while the object lives.
#pragma once

#include <stdlib.h>

#include <filesystem>
#include <fstream>
#include <string>

class TestRoot {
public:
    TestRoot() {
        std::string pattern = (std::filesystem::temp_directory_path() / "vps-XXXXXX").string();
        mPath = mkdtemp(pattern.data());
        for (const char* folder : {"tmp", "opt/usr/dbspace", "opt/usr/data/vantor-pim-sync",
                                   "opt/usr/apps/com.morvane.vantor-service-account-lite/shared/trusted"}) {
            std::filesystem::create_directories(mPath / folder);
        }
        for (const char* file : {".notificationPathCalendar", ".notificationPathContacts"}) {
            std::ofstream(mPath / "opt/usr/data/vantor-pim-sync" / file);
        }
        setenv("VANTOR_PIM_SYNC_ROOT", mPath.c_str(), 1);
    }
    ~TestRoot() {
        unsetenv("VANTOR_PIM_SYNC_ROOT");
        std::error_code ignored;
        std::filesystem::remove_all(mPath, ignored);
    }
    TestRoot(const TestRoot&) = delete;
    TestRoot& operator=(const TestRoot&) = delete;

    [[nodiscard]] const std::filesystem::path& path() const { return mPath; }
    // A path of the system ("/opt/usr/...") inside this root.
    [[nodiscard]] std::filesystem::path at(const std::string& absolute) const {
        return mPath / absolute.substr(1);
    }

private:
    std::filesystem::path mPath;
};
