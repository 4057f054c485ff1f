#include "zvhostq/stdpath_table.h"

#include "zvdynlib/dynload.h"
#include "zverr/tLocalStatus.h"
#include "zvplat/protons/cppNewDelete/memoryAllocation.h"
#include "zvplat/tFixedStatusAdapter.h"

#include <cstring>
#include <dlfcn.h>
#include <memory>
#include <stdexcept>

namespace zvhostq {

namespace {

// Other units build the table from their initialisers, so nothing here may need one of its own.
struct tDefault {
    const char* name;
    const char* value;
};
constexpr tDefault kDefaults[] = {
    {"prefixdir", "/usr"},
    {"execprefixdir", "/usr"},
    {"bindir", "/usr/bin"},
    {"sbindir", "/usr/sbin"},
    {"libdir", "/usr/lib"},
    {"lib32dir", "/usr/lib"},
    {"lib64dir", "/usr/lib64"},
    {"nativelibdir", "/usr/lib"},
    {"multiarchlibdir", "/usr/lib/arm-linux-gnueabi"},
    {"libexecdir", "/usr/libexec"},
    {"sharedstatedir", "/var/lib"},
    {"datarootdir", "/usr/share"},
    {"datadir", "/usr/share"},
    {"sysconfdir", "/etc"},
    {"localstatedir", "/var"},
    {"runstatedir", "/var/run"},
    {"includedir", "/usr/include"},
    {"docdir", "/usr/share/doc"},
    {"initddir", "/etc/init.d"},
};

constexpr const char* kRelocationLibrary = "libzvrelocations.so.0"; // by the loader's own search
constexpr const char* kRelocationSymbol = "get_relocated_dir";
constexpr size_t kAnswerSize = 255;

struct tLibraryCloser {
    void operator()(void* handle) const { zvdynlib_close(handle); }
};
using tLibrary = std::unique_ptr<void, tLibraryCloser>;

// An exception of the library's must not outlive it: its code would be gone where it is destroyed.
int ask(tRelocate relocate, const char* name, char* answer)
{
    try {
        return relocate(name, answer, kAnswerSize);
    } catch (...) { // NOLINT(bugprone-empty-catch): it ends here, and one of ours goes on
    }
    throw std::runtime_error("the relocation library threw");
}

// What went wrong in building the table, for the life of the process.
zverr_Status& initialisationStatus()
{
    static zverr::tLocalStatus status;
    return status;
}

} // namespace

const stdpath_table& stdpath_table::instance(zverr_Status* status)
{
    zverr_Status& initialisation = initialisationStatus(); // ends after the table
    static const stdpath_table table(&initialisation);
    zverr_copyStatus(status, &initialisation);
    return table;
}

stdpath_table::stdpath_table(zverr_Status* status)
{
    for (const tDefault& row : kDefaults) {
        add(row.name, row.value, status);
    }
    relocateAll(status);
}

void stdpath_table::add(const char* name, const char* value, zverr_Status* status)
{
    stdpath_entry entry(name, value, status);
    entries.open_gap(entries.size, 1, status);
    if (status->code < 0) return;
    // NOLINTNEXTLINE(clang-analyzer-core.CallAndMessage): the gap is there
    entries.data[entries.size].swap(entry);
    ++entries.size;
}

void stdpath_table::get(const zvktl::err::string& name, zvktl::err::string* value,
                        zverr_Status* status) const
{
    const stdpath_entry* const entry = find(name.getText(), name.getSize());
    if (entry == nullptr) {
        zverr_setCode(status, zvplaterr_osFault);
        return;
    }
    value->assign(entry->value.getText(), entry->value.getSize(), status);
}

// That there is no such library or symbol is no failure: the defaults stand.
void stdpath_table::relocateAll(zverr_Status* status)
{
    zverr::tLocalStatus loading;
    const tLibrary library(zvdynlib_load(kRelocationLibrary, RTLD_NOW | RTLD_GLOBAL, &loading));
    relocate =
        reinterpret_cast<tRelocate>(zvdynlib_symbol(library.get(), kRelocationSymbol, &loading));
    if (loading.code < 0) return;
    for (const tDefault& row : kDefaults) {
        relocateOne(row.name, status);
    }
    relocate = nullptr; // gone with the library
}

void stdpath_table::relocateOne(const char* name, zverr_Status* status)
{
    const std::unique_ptr<char[]> answer(
        zvplat::newArray(kAnswerSize, zvplat::tFixedStatusAdapter(status).get()));
    if (status->code < 0) return;
    answer[0] = 0;
    const int result = ask(relocate, name, answer.get());
    if (result == 0) return; // whatever is in the buffer
    if (result < 0) {
        zverr_setCode(status, zvplaterr_resourceNotFound);
        return;
    }
    answer[kAnswerSize - 1] = 0;
    stdpath_entry* const entry = find(name, std::strlen(name));
    if (entry != nullptr) {
        entry->value.assign(answer.get(), std::strlen(answer.get()), status);
    } else {
        add(name, answer.get(), status);
    }
}

stdpath_entry* stdpath_table::find(const char* name, size_t length) const
{
    for (size_t i = 0; i < entries.size; ++i) {
        stdpath_entry& entry = entries.data[i];
        if (entry.name.getSize() == length &&
            std::memcmp(entry.name.getText(), name, length) == 0) {
            return &entry;
        }
    }
    return nullptr;
}

} // namespace zvhostq
