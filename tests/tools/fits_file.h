#pragma once

#include <fitsio.h>
#include <gtest/gtest.h>

#include <array>
#include <cstdint>
#include <string>
#include <vector>

namespace ZentaraTest {

inline std::string ReadFitsText(fitsfile* file, const char* key) {
    std::array<char, FLEN_VALUE> value{};
    int status = 0;
    fits_read_key_str(file, key, value.data(), nullptr, &status);
    EXPECT_EQ(0, status) << key;
    return value.data();
}

inline double ReadFitsNumber(fitsfile* file, const char* key) {
    double value = -1;
    int status = 0;
    fits_read_key_dbl(file, key, &value, nullptr, &status);
    EXPECT_EQ(0, status) << key;
    return value;
}

/// A FITS file opened for reading; null when it cannot be opened.
class FitsFile {
  public:
    explicit FitsFile(const std::string& path) {
        int status = 0;
        fits_open_diskfile(&file, path.c_str(), READONLY, &status);
        EXPECT_EQ(0, status) << path;
    }
    ~FitsFile() {
        int status = 0;
        if (file != nullptr) fits_close_file(file, &status);
    }
    FitsFile(const FitsFile&) = delete;
    FitsFile& operator=(const FitsFile&) = delete;

    [[nodiscard]] fitsfile* Get() const { return file; }

    [[nodiscard]] std::vector<std::uint16_t> ReadPixels() const {
        std::array<LONGLONG, 2> size{};
        int status = 0;
        fits_get_img_sizell(file, 2, size.data(), &status);
        std::vector<std::uint16_t> pixels(static_cast<std::size_t>(size[0] * size[1]));
        fits_read_img(file, TUSHORT, 1, size[0] * size[1], nullptr, pixels.data(), nullptr,
                      &status);
        EXPECT_EQ(0, status);
        return pixels;
    }

  private:
    fitsfile* file = nullptr;
};

}  // namespace ZentaraTest
