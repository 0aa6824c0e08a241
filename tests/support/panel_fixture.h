// The fixture every panel test starts from: the simulator powered on with a chosen system,
// the defaults set, the module table cleared, no window alive, and a dialog responder that
// records every message and answers from a script.
#pragma once

#include <gtest/gtest.h>

#include <deque>
#include <string>
#include <vector>

#include "core/dialogs.h"
#include "sim_control.h"

struct Message {
    dialogs::Kind kind;
    std::string text;
};

class PanelTest : public testing::Test {
  protected:
    void SetUp() override;
    void TearDown() override;

    // Powers the simulator on with these modules and clears the panel state.
    void use_system(const std::vector<sim::ModuleSpec>& modules);

    // Answers for the coming Yes/No questions, in order; Yes when none is left.
    void answer(dialogs::Answer a) { answers_.push_back(a); }

    std::vector<Message> messages;

  private:
    std::deque<dialogs::Answer> answers_;
};
