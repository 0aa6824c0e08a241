// What the page tests share: a started panel in a 900 x 700 main window, typing and clicking as a
// user does, and the simulator's call log read back.
#pragma once

#include <QComboBox>
#include <QLineEdit>
#include <QTest>
#include <initializer_list>
#include <string>
#include <vector>

#include "core/global.h"
#include "core/windows.h"
#include "display/MainFrm.h"
#include "page_readability.h"
#include "panel_fixture.h"

using Texts = std::vector<std::string>;

class PageTest : public PanelTest {
  protected:
    void SetUp() override {
        PanelTest::SetUp();
        start(sim::default_system());  // 16 inputs on two modules
    }

    void start(const std::vector<sim::ModuleSpec>& system) {
        forms::destroy_all();
        use_system(system);
        main().Form_Load();
        main().resize(900, 700);
        sim::clear_call_log();
    }

    static MainFrm& main() { return forms::get<MainFrm>(); }

    // Types over the whole text, one key at a time; an empty text deletes it.
    static void type(QLineEdit* box, const char* text) {
        box->selectAll();
        if (*text == '\0')
            QTest::keyClick(box, Qt::Key_Delete);
        QTest::keyClicks(box, QString::fromUtf8(text));
    }
    static void type(QComboBox* box, const char* text) { type(box->lineEdit(), text); }
    static void click(QAbstractButton* b) { QTest::mouseClick(b, Qt::LeftButton); }

    static std::string text(const QComboBox* box) { return box->currentText().toStdString(); }
    static std::string text(const QLineEdit* box) { return box->text().toStdString(); }
    static std::string text(const QLabel* label) { return label->text().toStdString(); }
    static Texts items(const QComboBox* box) {
        Texts out;
        for (int i = 0; i < box->count(); ++i)
            out.push_back(box->itemText(i).toStdString());
        return out;
    }

    // The logged calls whose name (without "ost7720_") starts with one of the prefixes, as
    // "setRange(channel, value)"; every one must carry the panel's session.
    static Texts calls(std::initializer_list<std::string> prefixes) {
        Texts out;
        for (const sim::Call& c : sim::call_log()) {
            const std::string name = c.name.substr(8);
            bool wanted = false;
            for (const std::string& p : prefixes)
                wanted = wanted || name.rfind(p, 0) == 0;
            if (!wanted)
                continue;
            EXPECT_EQ(c.args.at(0), std::to_string(global::session)) << c.line();
            std::string line = name + "(";
            for (size_t i = 1; i < c.args.size(); ++i)
                line += (i > 1 ? ", " : "") + c.args[i];
            out.push_back(line + ")");
        }
        return out;
    }
    static int count(const std::string& name) {
        int n = 0;
        for (const sim::Call& c : sim::call_log())
            n += c.name == "ost7720_" + name ? 1 : 0;
        return n;
    }

    Texts notices() const {
        Texts out;
        for (const Message& m : messages)
            if (m.kind == dialogs::Kind::notice)
                out.push_back(m.text);
        return out;
    }
};
