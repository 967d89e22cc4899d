/*
 * A PAM module that takes its time and has no opinion:
 *
 *     slow           takes 20 ms, as checking a password does
 *     hangs=FILE     does not return where the user is nobody, and writes a byte to the file before
 */
#include <security/pam_modules.h>

#include <unistd.h>

#include <chrono>
#include <fstream>
#include <string>
#include <string_view>
#include <thread>

extern "C" int pam_sm_authenticate(pam_handle_t* handle, int /*flags*/, int count, const char** arguments) {
    constexpr std::string_view hangs = "hangs=";
    const char* user = nullptr;
    pam_get_user(handle, &user, nullptr);
    for (int i = 0; i < count; ++i) {
        const std::string_view argument = arguments[i];
        if (argument == "slow") {
            std::this_thread::sleep_for(std::chrono::milliseconds{20});
        } else if (argument.starts_with(hangs) && user == std::string_view("nobody")) {
            std::ofstream(std::string(argument.substr(hangs.size())), std::ios::app) << '.';
            while (true) {
                pause();
            }
        }
    }
    return PAM_IGNORE;
}

extern "C" int pam_sm_setcred(pam_handle_t* /*handle*/, int /*flags*/, int /*count*/, const char** /*arguments*/) {
    return PAM_IGNORE;
}
