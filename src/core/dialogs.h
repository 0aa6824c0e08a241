// The one seam for message boxes and for ending the program, so tests can answer and observe
// them.
#pragma once

#include <functional>
#include <string>

namespace dialogs {

enum class Answer { ok, yes, no };
enum class Kind { notice, question };

// Shows a modal notice with only an OK button and the application's title.
void notice(const std::string& text);

// Shows a modal Yes/No question with the stop icon; true when the user answers Yes.
bool ask_yes_no(const std::string& text);

// A responder replaces the message boxes: it gets every text and gives the answer.
using Responder = std::function<Answer(Kind, const std::string&)>;
void set_responder(Responder responder);
void clear_responder();

// The application's title on every box.
inline constexpr const char* app_title = "Ostrana K7720A Soft Front Panel";

}  // namespace dialogs

// Ends the process at once with status 0: no handler and no driver call runs after it.
[[noreturn]] void end_program();

// Lets pending window events run.
void do_events();
