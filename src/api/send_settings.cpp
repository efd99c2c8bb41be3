#include "api/send_settings.h"

namespace ZV {

ZentaraResult SendSettings(ZentaraHandle, Zentara_Settings*) {
    return zerrNotSupported;
}

}  // namespace ZV
