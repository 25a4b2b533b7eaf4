// Annotations of outline rows.
#include "outline/qr_outline_annotation.h"

QR_OutlineAnnotation::QR_OutlineAnnotation(const char* action_string, std::uint32_t line, std::uint32_t column,
                                           const unsigned char* bits, std::uint32_t width, std::uint32_t height)
    : line_(line),
      column_(column),
      name_(XrmStringToQuark(action_string ? action_string : "")),
      bits_(bits),
      width_(bits ? width : 0),
      height_(bits ? height : 0) {}

QR_OutlineAnnotation::~QR_OutlineAnnotation() = default;
