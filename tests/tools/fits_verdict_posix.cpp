#include "tools/fits_verdict.h"
#include "tools/program.h"

namespace ZentaraTest {

bool IsFitsGood(const std::string& path) {
    const ProgramResult verified = RunTool({"fitsverify", "-q", path});
    return verified.exitCode == 0 && verified.output.find("verification OK") != std::string::npos;
}

}  // namespace ZentaraTest
