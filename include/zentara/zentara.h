#ifndef ZENTARA_ZENTARA_H
#define ZENTARA_ZENTARA_H

#include <stdint.h>

/** Marks what leaves the library. The one platform test of the project above its platform seam. */
#if defined(_WIN32)
#if defined(ZENTARA_BUILDING_LIBRARY)
#define ZENTARA_API __declspec(dllexport)
#else
#define ZENTARA_API __declspec(dllimport)
#endif
#else
#define ZENTARA_API __attribute__((visibility("default")))
#endif

#endif /* ZENTARA_ZENTARA_H */
