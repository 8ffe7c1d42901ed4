#include "tests/faults/Module_Memory.h"

#include <algorithm>
#include <array>
#include <atomic>
#include <cerrno>
#include <cstddef>
#include <cstring>
#include <dlfcn.h>
#include <malloc.h>
#include <mutex>
#include <new>
#include <pthread.h>
#include <stdexcept>
#include <sys/mman.h>
#include <sys/syscall.h>
#include <unistd.h>
#include <unordered_map>
#include <unwind.h>

#include "tests/support/code_range.h"

// The C library's own, under the names that it keeps for this.
extern "C" {
void* __libc_malloc(std::size_t size);
void* __libc_calloc(std::size_t count, std::size_t size);
void* __libc_realloc(void* block, std::size_t size);
void* __libc_memalign(std::size_t alignment, std::size_t size);
void __libc_free(void* block);
}

namespace nvrtest {

namespace {

Code_Range module, c_library, cxx_library;
char module_name[256]; // its file's, while it is being loaded
std::atomic<bool> is_starting{false};

bool is_library(std::uintptr_t place)
{
    return c_library.holds(place) || cxx_library.holds(place);
}

/// Set while the watching itself runs, whose own blocks are nobody's.
thread_local bool is_busy = false;
class Busy {
public:
    Busy() { is_busy = true; }
    ~Busy() { is_busy = false; }
    Busy(const Busy&) = delete;
    Busy& operator=(const Busy&) = delete;
};

// --- Places

constexpr std::size_t deepest = 16;
std::size_t depth = deepest; // frames in the module that tell places apart

struct Stack {
    std::array<std::uintptr_t, deepest> frames;
    std::size_t size = 0;

    std::uint64_t id() const
    {
        std::uint64_t hash = 14695981039346656037u; // FNV-1a over the words
        for (std::size_t i = 0; i < size; i++)
            hash = (hash ^ frames[i]) * 1099511628211u;
        hash ^= hash >> 32; // twelve digits are enough to tell some thousands apart
        return hash & 0xffffffffffff;
    }
};

// Of the place to refuse; if set, only what asks from there is told by more than this one frame, which spares walks.
std::uintptr_t wanted_frame = 0;

bool tells_enough(std::uintptr_t frame)
{
    return wanted_frame != 0 && frame != wanted_frame;
}

/// The module's frames above a call of malloc; none if another one asks.
Stack stack_of(std::uintptr_t caller)
{
    if (module.holds(caller) && tells_enough(module.offset(caller))) return {{module.offset(caller)}, 1};
    struct Walk {
        std::uintptr_t caller;
        Stack stack;
        bool is_at_caller = false;
        int steps = 0;
    } walk{caller, {}};
    _Unwind_Backtrace(
        [](_Unwind_Context* frame, void* data) {
            auto& [caller, stack, is_at_caller, steps] = *static_cast<Walk*>(data);
            const std::uintptr_t place = _Unwind_GetIP(frame);
            is_at_caller = is_at_caller || place == caller; // this program's own frames come before
            if (++steps > 64) return _URC_END_OF_STACK;
            if (!is_at_caller) return _URC_NO_REASON;
            if (module.holds(place))
                stack.frames[stack.size++] = module.offset(place);
            else if (!is_library(place))
                return _URC_END_OF_STACK;
            const bool ends = stack.size == depth || (stack.size == 1 && tells_enough(stack.frames[0]));
            return ends ? _URC_END_OF_STACK : _URC_NO_REASON;
        },
        &walk);
    return walk.stack;
}

struct Site {
    std::atomic<std::uint64_t> id{0};
    std::atomic<std::uint64_t> asked{0};
    std::atomic<std::int64_t> held{0};
    std::size_t order = 0;
    Stack stack;
};

constexpr std::size_t most_sites = 1 << 15;
Site sites[most_sites];
std::mutex sites_mutex; // for those that make one
std::size_t sites_made = 0;

Site& site_of(const Stack& stack)
{
    const std::uint64_t id = stack.id();
    for (std::size_t at = id % most_sites;; at = (at + 1) % most_sites) {
        std::uint64_t found = sites[at].id.load(std::memory_order_acquire);
        if (found == id) return sites[at];
        if (found != 0) continue;
        std::lock_guard<std::mutex> lock(sites_mutex);
        found = sites[at].id;
        if (found == id) return sites[at];
        if (found != 0) continue;
        sites[at].order = sites_made++;
        sites[at].stack = stack;
        sites[at].id.store(id, std::memory_order_release);
        return sites[at];
    }
}

// --- Refusal

std::atomic<std::uint64_t> refused_site{0}, refused_time{0};
std::atomic<bool> is_lasting{false}, refuses_all{false};
std::atomic<std::uint64_t> refusals{0};

bool refuses(Site& site)
{
    const std::uint64_t time = ++site.asked;
    const bool is_it = site.id == refused_site && time == refused_time;
    if (is_it && is_lasting) refuses_all = true;
    if (!is_it && !refuses_all) return false;
    refusals++;
    return true;
}

// --- Blocks that are out

struct Shard {
    std::mutex mutex;
    std::unordered_map<void*, Site*> blocks;
};
constexpr std::size_t number_of_shards = 64;
std::atomic<std::int64_t> held{0};

Shard& shard_of(void* block)
{
    static auto* shards = new std::array<Shard, number_of_shards>; // there for the last free of the process
    return (*shards)[reinterpret_cast<std::uintptr_t>(block) / 64 % number_of_shards];
}

void goes_out(void* block, Site& site)
{
    if (!block) return;
    Shard& shard = shard_of(block);
    std::lock_guard<std::mutex> lock(shard.mutex);
    shard.blocks[block] = &site;
    site.held++;
    held++;
}

/// The place that asked for it, or null.
Site* comes_back(void* block)
{
    if (!block || is_busy || !module.is_found()) return nullptr;
    const Busy busy;
    Shard& shard = shard_of(block);
    std::lock_guard<std::mutex> lock(shard.mutex);
    const auto found = shard.blocks.find(block);
    if (found == shard.blocks.end()) return nullptr;
    Site* site = found->second;
    shard.blocks.erase(found);
    site->held--;
    held--;
    return site;
}

/// Where the module asks, or null if another one does.
Site* asked_by(std::uintptr_t caller)
{
    if (is_busy) return nullptr;
    if (!module.is_found()) {
        if (!is_starting) return nullptr;
        const Busy busy;
        if (!module.find(module_name)) return nullptr;
    }
    if (!module.holds(caller) && !is_library(caller)) return nullptr;
    const Busy busy; // the unwinder may allocate
    const Stack stack = stack_of(caller);
    return stack.size ? &site_of(stack) : nullptr;
}

/// The block that `make` gives, unless it is refused to the caller.
template <class Make>
void* allocate(std::uintptr_t caller, Make make)
{
    Site* site = asked_by(caller);
    if (!site) return make();
    if (refuses(*site)) {
        errno = ENOMEM;
        return nullptr;
    }
    void* block = make();
    const Busy busy;
    goes_out(block, *site);
    return block;
}

} // namespace

void watch_memory_of(const std::string& file, std::size_t frames)
{
    depth = std::clamp<std::size_t>(frames, 1, deepest);
    if (!c_library.find("/libc.so") || !cxx_library.find("/libstdc++.so"))
        throw std::runtime_error("the C and the C++ library are not found");
    const std::string name = file.substr(file.rfind('/') + 1);
    name.copy(module_name, sizeof module_name - 1);
    is_starting = true;
    if (!dlopen(file.c_str(), RTLD_NOW)) throw std::runtime_error(dlerror());
    is_starting = false;
    if (!module.is_found() && !module.find(name)) throw std::runtime_error("no code of " + name);
}

std::vector<Allocation_Site> allocation_sites()
{
    std::vector<const Site*> made;
    for (const Site& site : sites)
        if (site.id != 0) made.push_back(&site);
    std::sort(made.begin(), made.end(), [](const Site* a, const Site* b) { return a->order < b->order; });
    std::vector<Allocation_Site> all;
    for (const Site* site : made) {
        const auto& frames = site->stack.frames;
        all.push_back({site->id,
                       site->asked,
                       site->held,
                       {frames.begin(), frames.begin() + static_cast<std::ptrdiff_t>(site->stack.size)}});
    }
    return all;
}

std::int64_t blocks_held()
{
    return held;
}

void refuse(const Allocation_Site& site, std::uint64_t nth, Refusal refusal)
{
    std::uint64_t before = 0;
    for (const Site& one : sites)
        if (one.id == site.id) before = one.asked;
    wanted_frame = site.stack.front();
    is_lasting = refusal == Refusal::lasting;
    refused_time = before + nth;
    refused_site = site.id;
}

void end_refusal()
{
    refused_site = 0;
    refuses_all = false;
}

std::uint64_t refused()
{
    return refusals;
}

// --- Threads

namespace {

std::atomic<int> threads{0};

struct Start {
    void* (*proc)(void*);
    void* argument;
};

void* counted(void* argument)
{
    const Start start = *static_cast<Start*>(argument);
    {
        const Busy busy;
        delete static_cast<Start*>(argument);
    }
    struct Counted {
        ~Counted() { threads--; } // also if the thread is cancelled
    } end;
    return start.proc(start.argument);
}

} // namespace

int threads_of_module()
{
    return threads;
}

} // namespace nvrtest

#define NVR_CALLER reinterpret_cast<std::uintptr_t>(__builtin_return_address(0))
#define NVR_FOR_ALL __attribute__((visibility("default")))

// Those of the C++ library would do, but the caller would be that library then, and each of the program's own objects
// would need a walk. Their counterparts call free.

NVR_FOR_ALL void* operator new(std::size_t size, const std::nothrow_t&) noexcept
{
    return nvrtest::allocate(NVR_CALLER, [&] { return __libc_malloc(size ? size : 1); });
}

NVR_FOR_ALL void* operator new[](std::size_t size, const std::nothrow_t&) noexcept
{
    return nvrtest::allocate(NVR_CALLER, [&] { return __libc_malloc(size ? size : 1); });
}

NVR_FOR_ALL void* operator new(std::size_t size)
{
    if (void* block = nvrtest::allocate(NVR_CALLER, [&] { return __libc_malloc(size ? size : 1); })) return block;
    throw std::bad_alloc();
}

NVR_FOR_ALL void* operator new[](std::size_t size)
{
    if (void* block = nvrtest::allocate(NVR_CALLER, [&] { return __libc_malloc(size ? size : 1); })) return block;
    throw std::bad_alloc();
}

extern "C" {

NVR_FOR_ALL void* malloc(std::size_t size)
{
    return nvrtest::allocate(NVR_CALLER, [&] { return __libc_malloc(size); });
}

NVR_FOR_ALL void* calloc(std::size_t count, std::size_t size)
{
    return nvrtest::allocate(NVR_CALLER, [&] { return __libc_calloc(count, size); });
}

NVR_FOR_ALL void* realloc(void* old, std::size_t size)
{
    nvrtest::Site* asks = nvrtest::asked_by(NVR_CALLER);
    if (asks && size && nvrtest::refuses(*asks)) {
        errno = ENOMEM;
        return nullptr;
    }
    nvrtest::Site* had = nvrtest::comes_back(old);
    void* block = __libc_realloc(old, size);
    if (!asks) asks = had; // whoever makes it larger, it is the module's
    if (asks) {
        const nvrtest::Busy busy;
        nvrtest::goes_out(block, *asks);
    }
    return block;
}

// The module's blocks are refused, each of them: the pieces that it would cut from them then come from the heap, where
// they are told apart.
NVR_FOR_ALL void* mmap(void* place, std::size_t size, int protection, int flags, int file, off_t from) noexcept
{
    if (nvrtest::module.holds(NVR_CALLER)) {
        errno = ENOMEM;
        return MAP_FAILED;
    }
    return reinterpret_cast<void*>(::syscall(SYS_mmap, place, size, protection, flags, file, from));
}

NVR_FOR_ALL void* memalign(std::size_t alignment, std::size_t size)
{
    return nvrtest::allocate(NVR_CALLER, [&] { return __libc_memalign(alignment, size); });
}

NVR_FOR_ALL void* aligned_alloc(std::size_t alignment, std::size_t size)
{
    return nvrtest::allocate(NVR_CALLER, [&] { return __libc_memalign(alignment, size); });
}

NVR_FOR_ALL int posix_memalign(void** block, std::size_t alignment, std::size_t size)
{
    void* made = nvrtest::allocate(NVR_CALLER, [&] { return __libc_memalign(alignment, size); });
    if (!made) return ENOMEM;
    *block = made;
    return 0;
}

NVR_FOR_ALL void free(void* block)
{
    nvrtest::comes_back(block);
    __libc_free(block);
}

NVR_FOR_ALL int pthread_create(pthread_t* thread, const pthread_attr_t* attributes, void* (*proc)(void*),
                               void* argument)
{
    using Create = int (*)(pthread_t*, const pthread_attr_t*, void* (*)(void*), void*);
    static const auto create = reinterpret_cast<Create>(dlsym(RTLD_NEXT, "pthread_create"));
    if (!nvrtest::module.holds(NVR_CALLER)) return create(thread, attributes, proc, argument);
    nvrtest::Start* start;
    {
        const nvrtest::Busy busy;
        start = new nvrtest::Start{proc, argument};
    }
    nvrtest::threads++;
    const int status = create(thread, attributes, nvrtest::counted, start);
    if (status != 0) {
        nvrtest::threads--;
        const nvrtest::Busy busy;
        delete start;
    }
    return status;
}

} // extern "C"
