# Writes OUTPUT, a source that holds the text of PAGE; an empty one where there is no page.
set(text "")
if(PAGE)
  file(READ ${PAGE} text)
endif()
string(FIND "${text}" ")page\"" end)
if(NOT end EQUAL -1)
  message(FATAL_ERROR "${PAGE} holds the end of a literal")
endif()
file(WRITE ${OUTPUT} "#include <string_view>

namespace Zulm {

std::string_view builtInPage();

std::string_view builtInPage() {
    return R\"page(${text})page\";
}

} // namespace Zulm
")
