// Built-in defaults of the adjustment preferences, and the safe one-argument formatter.
#include "adjust/adjust_settings.h"

namespace {
AdjustSettingsProvider gProvider = nullptr;
}

AdjustSettings adjustSettings() { return gProvider ? gProvider() : AdjustSettings{}; }

void setAdjustSettingsProvider(AdjustSettingsProvider provider) { gProvider = provider; }

std::string formatWithString(const std::string& format, const std::string& arg) {
  std::string out;
  bool used = false;
  for (size_t i = 0; i < format.size(); ++i) {
    if (format[i] == '%' && i + 1 < format.size()) {
      if (format[i + 1] == '%') {
        out += '%';
        ++i;
        continue;
      }
      if (format[i + 1] == 's' && !used) {
        out += arg;
        used = true;
        ++i;
        continue;
      }
    }
    out += format[i];
  }
  return out;
}
