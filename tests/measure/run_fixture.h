// What the run tests share: the main window driven through its buttons and its timer on the
// simulator's virtual clock, a private folder for output files, and counts over the call log
// and the files.
#pragma once

#include <gtest/gtest.h>
#include <unistd.h>

#include <QTest>
#include <algorithm>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>

#include "core/global.h"
#include "core/windows.h"
#include "display/MainFrm.h"
#include "panel_fixture.h"

class RunTest : public PanelTest {
  protected:
    void SetUp() override {
        PanelTest::SetUp();
        dir_ = std::filesystem::temp_directory_path() / ("k7720-run-" + std::to_string(::getpid()));
        empty_folder();
    }
    void TearDown() override {
        std::filesystem::remove_all(dir_);
        PanelTest::TearDown();
    }
    void empty_folder() const {
        std::filesystem::remove_all(dir_);
        std::filesystem::create_directories(dir_);
    }
    std::string file(const std::string& name) const { return (dir_ / name).string(); }

    static MainFrm& main() { return forms::get<MainFrm>(); }
    static void click(QAbstractButton* button) { QTest::mouseClick(button, Qt::LeftButton); }
    // One timer tick after the clock moved on by this much.
    static void tick(double seconds) {
        sim::advance_clock(seconds);
        main().MainTimer_Timer();
    }

    std::filesystem::path dir_;
};

inline size_t calls_to(const std::string& name) {
    const auto& log = sim::call_log();
    return static_cast<size_t>(
        std::count_if(log.begin(), log.end(), [&](const sim::Call& c) { return c.name == name; }));
}

inline size_t lines_in(const std::string& path) {
    std::ifstream in(path, std::ios::binary);
    return static_cast<size_t>(
        std::count(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>(), '\n'));
}
