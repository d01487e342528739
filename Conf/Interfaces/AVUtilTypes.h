// libavutil's pixel and sample format enumerations, used by the interfaces as types only: the
// Tarvek libraries call no libavutil function and do not link it.
#ifndef TARVEK_CONF_INTERFACES_AVUTILTYPES_H_
#define TARVEK_CONF_INTERFACES_AVUTILTYPES_H_

extern "C" {
#include <libavutil/pixfmt.h>
#include <libavutil/samplefmt.h>
}

#endif  // TARVEK_CONF_INTERFACES_AVUTILTYPES_H_
