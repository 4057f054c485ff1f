#include "zvdynlib/dynload.h"

#include "zverr/payload.h"

#include <dlfcn.h>

namespace {

const char* const kDetails = "zvdynlib_debug";

void addLoadersWord(zverr_JsonWriter& writer)
{
    const char* const word = dlerror();
    writer.addObject("internal_error")
        .addString("api", "dlerror")
        // unreached: null for a symbol at address 0, which only a linker script makes
        .addString("string", word != nullptr ? word : "")
        .endObject();
}

} // namespace

void* zvdynlib_load(const char* path, int flag, zverr_Status* status)
{
    if (status->code < 0) return nullptr;
    void* const handle = dlopen(path, flag);
    if (handle != nullptr) return handle;
    zverr_JsonWriter writer = zverr_setFailure(status, zverr::kAtLoad);
    writer.addObject(kDetails)
        .addString("debug", "failed to zvdynlib_load library")
        .addString("path", path)
        .endObject();
    addLoadersWord(writer);
    return nullptr;
}

void* zvdynlib_symbol(void* handle, const char* symbol, zverr_Status* status)
{
    if (status->code < 0) return nullptr;
    void* const address = dlsym(handle, symbol);
    if (address != nullptr) return address;
    zverr_JsonWriter writer = zverr_setFailure(status, zverr::kAtSymbol);
    writer.addObject(kDetails).addString("zvdynlib_symbol", symbol).endObject();
    addLoadersWord(writer);
    return nullptr;
}

int zvdynlib_close(void* handle) { return dlclose(handle); }
