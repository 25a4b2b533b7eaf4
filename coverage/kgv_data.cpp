// Copies, sizes and count arithmetic of the coverage data records.
#include "coverage/kgv_data.h"

namespace {
bool g_hitFlagsMode = false;
}

std::uint32_t recordWords(const ObjRecord& r) {
  std::uint64_t n = r.map.size();
  std::uint64_t bytes = sizeof(ObjHeader) + 6 * n + (n % 2 ? 2 : 0);
  return static_cast<std::uint32_t>(bytes / 4 + r.strings.size() / 4);
}

void rebuildRecordSizes(KgvData& d) {
  d.recordSizes.clear();
  d.recordSizes.reserve(d.records.size());
  for (const auto& r : d.records) d.recordSizes.push_back(recordWords(*r));
}

std::unique_ptr<ObjRecord> copyObjRecord(const ObjRecord& r) {
  auto c = std::make_unique<ObjRecord>();
  c->objHeader = r.objHeader;
  c->strings = r.strings;
  c->map = r.map;
  c->counts = r.counts;
  c->fileNameOffset = r.fileNameOffset;
  return c;
}

std::unique_ptr<KgvData> copyKgvData(const KgvData& d) {
  auto c = std::make_unique<KgvData>();
  c->header = d.header;
  c->recordSizes = d.recordSizes;
  c->mergeMode = d.mergeMode;
  c->records.reserve(d.records.size());
  for (const auto& r : d.records) c->records.push_back(copyObjRecord(*r));
  return c;
}

void setHitFlagsMode(bool hitFlagsOnly) { g_hitFlagsMode = hitFlagsOnly; }
bool hitFlagsMode() { return g_hitFlagsMode; }

std::uint16_t combineCounts(std::uint16_t a, std::uint16_t b) {
  return combineCounts(a, b, g_hitFlagsMode);
}

bool sameVersion(const ObjRecord& a, const ObjRecord& b) {
  return a.objHeader.signature != 0 && a.objHeader.signature == b.objHeader.signature &&
         a.map.size() == b.map.size() && a.strings.size() == b.strings.size();
}

bool isNewer(const ObjRecord& a, const ObjRecord& b) {
  return isNewerHeader(a.objHeader, b.objHeader);
}

bool isNewerHeader(const ObjHeader& x, const ObjHeader& y) {
  if (x.buildTime != y.buildTime) return x.buildTime > y.buildTime;
  if (x.lastTime != y.lastTime) return x.lastTime > y.lastTime;
  return x.firstTime > y.firstTime;
}
