#include "zverr/payload.h"

#include "zverr/errStatus.h"
#include "zverr/jsonz.h"
#include "zverr/jsonzLookup.h"

namespace {

constexpr uint32_t kLargestExtra = 0x7FFFFFFD;

char* growStatus(char* position, void* status)
{
    return zverr_growJson(position, static_cast<zverr_Status*>(status));
}

} // namespace

char* zverr_reserveJson(zverr_Status* status, uint32_t extra)
{
    if (extra > kLargestExtra) return nullptr;
    if (!zverr_ensureCapacity(status, extra + kJsonzOverhead)) return nullptr;
    const char* const bracket = jsonz_closingBracket(status->json);
    return bracket != nullptr ? status->json + (bracket - status->json) : nullptr;
}

char* zverr_growJson(char* position, zverr_Status* status)
{
    const auto offset = position - status->json;
    const uint32_t capacity = status->capacity;
    if (zverr_reserveJson(status, 2 * (capacity - kJsonzOverhead)) == nullptr) return nullptr;
    // A request that wrapped around got nothing, and would be repeated for ever.
    return status->capacity > capacity ? status->json + offset : nullptr;
}

zverr_JsonWriter::zverr_JsonWriter(zverr_Status* status)
    : position(zverr_reserveJson(status, kJsonzOverhead)), grower{growStatus, status}
{}

zverr_JsonWriter& zverr_JsonWriter::addString(const char* key, const char* value)
{
    position = jsonz_addString(position, key, value, &grower);
    return *this;
}

zverr_JsonWriter& zverr_JsonWriter::addString(const char* key, const std::string& value)
{
    position = jsonz_addString(position, key, value, &grower);
    return *this;
}

zverr_JsonWriter& zverr_JsonWriter::addInt(const char* key, int32_t value)
{
    position = jsonz_addInt(position, key, value, &grower);
    return *this;
}

zverr_JsonWriter& zverr_JsonWriter::addUInt(const char* key, uint32_t value)
{
    position = jsonz_addUInt(position, key, value, &grower);
    return *this;
}

zverr_JsonWriter& zverr_JsonWriter::addObject(const char* key)
{
    position = jsonz_addObject(position, key, &grower);
    return *this;
}

zverr_JsonWriter& zverr_JsonWriter::endObject()
{
    position = jsonz_endObject(position);
    return *this;
}

zverr_JsonWriter& zverr_JsonWriter::addSource(const zverr_SourcePosition& source)
{
    addString("file", source.file).addUInt("line", source.line);
    return source.component != nullptr ? addString("component", source.component) : *this;
}

zverr_JsonWriter zverr_setFailure(zverr_Status* status, const zverr_RaisingSite& site)
{
    if (!zverr_setCode(status, site.code)) return {};
    zverr_JsonWriter writer(status);
    if (site.constant != nullptr) writer.addString("error_constant", site.constant);
    writer.addSource(site.position);
    return writer;
}
