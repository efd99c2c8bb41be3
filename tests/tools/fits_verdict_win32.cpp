#include "tools/fits_file.h"
#include "tools/fits_verdict.h"

namespace ZentaraTest {

bool IsFitsGood(const std::string& path) {
    const FitsFile file(path);
    int data = 0, header = 0, status = 0;
    if (file.Get() == nullptr) return false;
    fits_verify_chksum(file.Get(), &data, &header, &status);
    return status == 0 && data == 1 && header == 1;
}

}  // namespace ZentaraTest
