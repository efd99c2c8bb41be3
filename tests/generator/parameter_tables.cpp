// Prints what scripts/generate-parameters writes: `parameter-tables document|names`.

#include <cstdio>
#include <cstring>

#include "api/parameter_documents.h"

int main(int count, char** arguments) {
    using namespace ZV::Test;
    const char* const what = count == 2 ? arguments[1] : "";
    if (std::strcmp(what, "document") == 0) {
        std::fputs(MakeParameterDocument().c_str(), stdout);
    } else if (std::strcmp(what, "names") == 0) {
        std::fputs(MakeParameterNames().c_str(), stdout);
    } else {
        std::fputs("usage: parameter-tables document|names\n", stderr);
        return 2;
    }
    return 0;
}
