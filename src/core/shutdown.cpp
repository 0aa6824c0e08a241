#include "core/shutdown.h"

#include "core/dialogs.h"
#include "core/global.h"
#include "ost7720.h"

void clean_driver_text(std::string& text) {
    const size_t nul = text.find('\0');
    if (nul == std::string::npos) {
        text.clear();
        return;
    }
    text.resize(nul);
    for (char& c : text) {
        const auto code = static_cast<unsigned char>(c);
        if (code < 32 || code > 126)
            c = ' ';
    }
    const size_t first = text.find_first_not_of(' ');
    if (first == std::string::npos) {
        text.clear();
        return;
    }
    text = text.substr(first, text.find_last_not_of(' ') - first + 1);
}

void report_driver_error(const std::string& name, int32_t code) {
    std::string error_text(256, ' ');
    ost7720_error_message(global::session, code, error_text.data());
    clean_driver_text(error_text);

    std::string details(100, ' ');
    ost7720_errorDetails(global::session, details.data(), 100);
    clean_driver_text(details);

    const std::string message =
        "The Ostrana K7720 Plug&Play library has reported an error\r\n"
        "ost7720_32.dll: " +
        name + " returned " + std::to_string(code) + " " + error_text + "\r\n" + details +
        "\r\n\r\nPress Yes to continue or No to exit the Soft Front Panel";
    if (!dialogs::ask_yes_no(message))
        end_program();
}

bool driver_ok(const char* name) {
    if (global::status == 0)
        return true;
    report_driver_error(name, global::status);
    return false;
}

void exit_panel() {
    global::status = ost7720_close(global::session);
    if (global::status != 0)
        report_driver_error("ost7720_close", global::status);
    end_program();
}
