// Prints the caption in the language of the environment. The program loads the library from where it is installed.
#include "Norv/Locale.h"

#include <iostream>

int main() {
    const auto& library = Norv::Locale::getResourceLibrary(2, Norv::Locale::getLanguageId());
    std::cout << Norv::make_string(Norv::ResourceString(library, L"MSGID_POWER_MANAGEMENT_CAPTION")) << '\n';
}
