#include "crashhandler/MiniDump.h"

#include "crashhandler/Mappings.h"
#include "crashhandler/SafeWriter.h"

#include <algorithm>
#include <cstring>
#include <ctime>
#include <elf.h>
#include <fcntl.h>
#include <string_view>
#include <sys/sysinfo.h>
#include <sys/uio.h>
#include <unistd.h>

namespace crashhandler {

namespace {

#pragma pack(push, 4)
struct SLocation {
    uint32_t size = 0;
    uint32_t position = 0;
};

struct SMemory {
    uint64_t start = 0;
    SLocation location;
};

struct SHeader {
    uint32_t signature = 0x504d444d; // "MDMP"
    uint32_t version = 0xa793;
    uint32_t streamCount = 0;
    uint32_t directory = sizeof(SHeader);
    uint32_t checksum = 0;
    uint32_t time = 0;
    uint64_t flags = 0;
};

struct SStream {
    uint32_t type = 0;
    SLocation location;
};

struct SSystemInfo {
    uint16_t architecture = 9; // x86-64
    uint16_t level = 0;
    uint16_t revision = 0;
    uint8_t processors = 0;
    uint8_t productType = 0;
    uint32_t version[3] = {};
    uint32_t platform = 0x8201; // Linux
    uint32_t servicePack = 0;
    uint32_t reserved = 0;
    uint8_t processor[24] = {};
};

struct SThread {
    uint32_t id = 0;
    uint32_t suspendCount = 0;
    uint32_t priorityClass = 0;
    uint32_t priority = 0;
    uint64_t environmentBlock = 0;
    SMemory stack;
    SLocation context;
};

struct SModule {
    uint64_t base = 0;
    uint32_t size = 0;
    uint32_t checksum = 0;
    uint32_t time = 0;
    uint32_t name = 0;
    uint8_t version[52] = {};
    SLocation codeView;
    SLocation miscellaneous;
    uint8_t reserved[16] = {};
};

struct SException {
    uint32_t thread = 0;
    uint32_t alignment = 0;
    uint32_t code = 0;
    uint32_t flags = 0;
    uint64_t record = 0;
    uint64_t address = 0;
    uint32_t parameterCount = 0;
    uint32_t alignment2 = 0;
    uint64_t parameters[15] = {};
    SLocation context;
};

struct SContext {
    uint64_t home[6] = {};
    uint32_t flags = 0x0010000f; // control, integer, segments, floating point
    uint32_t mxcsr = 0;
    uint16_t segments[6] = {}; // cs ds es fs gs ss
    uint32_t eflags = 0;
    uint64_t debug[6] = {};
    uint64_t rax = 0, rcx = 0, rdx = 0, rbx = 0, rsp = 0, rbp = 0, rsi = 0, rdi = 0;
    uint64_t r8 = 0, r9 = 0, r10 = 0, r11 = 0, r12 = 0, r13 = 0, r14 = 0, r15 = 0;
    uint64_t rip = 0;
    uint8_t floatingPoint[512] = {};
    uint8_t vectors[26 * 16] = {};
    uint64_t control[6] = {};
};
#pragma pack(pop)

static_assert(sizeof(SHeader) == 32 && sizeof(SStream) == 12 && sizeof(SSystemInfo) == 56);
static_assert(sizeof(SThread) == 48 && sizeof(SModule) == 108 && sizeof(SException) == 168);
static_assert(sizeof(SContext) == 1232);

enum EStream : uint32_t {
    kThreadList = 3,
    kModuleList = 4,
    kMemoryList = 5,
    kException = 6,
    kSystemInfo = 7,
    kLinuxStatus = 0x47670004,
    kLinuxMaps = 0x47670009,
};

constexpr size_t kMaxThreads = 256;
constexpr size_t kMaxModules = 512;
constexpr size_t kMaxStack = 256 * 1024;

bool readMemory(uintptr_t address, void* buffer, size_t size) {
    const iovec local{buffer, size};
    const iovec remote{reinterpret_cast<void*>(address), size};
    return ::process_vm_readv(::getpid(), &local, 1, &remote, 1, 0) == static_cast<ssize_t>(size);
}

struct SLoadedModule {
    SMapping mapping;
    uint8_t buildId[32] = {};
    uint32_t buildIdSize = 0;
};

void readBuildId(SLoadedModule& module) {
    Elf64_Ehdr header;
    if (!readMemory(module.mapping.start, &header, sizeof header)) return;
    if (std::memcmp(header.e_ident, ELFMAG, SELFMAG) != 0) return;
    for (int i = 0; i < header.e_phnum; ++i) {
        Elf64_Phdr program;
        if (!readMemory(module.mapping.start + header.e_phoff + i * sizeof program, &program, sizeof program))
            return;
        if (program.p_type != PT_NOTE) continue;
        for (uint64_t at = 0; at + sizeof(Elf64_Nhdr) < program.p_memsz;) {
            Elf64_Nhdr note;
            const uintptr_t address = module.mapping.start + program.p_vaddr + at;
            if (!readMemory(address, &note, sizeof note)) return;
            const uint64_t nameSize = (note.n_namesz + 3) & ~3ull;
            if (note.n_type == NT_GNU_BUILD_ID && note.n_descsz <= sizeof module.buildId) {
                if (readMemory(address + sizeof note + nameSize, module.buildId, note.n_descsz))
                    module.buildIdSize = note.n_descsz;
                return;
            }
            at += sizeof note + nameSize + ((note.n_descsz + 3) & ~3ull);
        }
    }
}

// Too large for an alternate signal stack.
SLoadedModule g_modules[kMaxModules];
SModule g_moduleRecords[kMaxModules];
SThread g_threadRecords[kMaxThreads];

size_t collectModules() {
    size_t count = 0;
    forEachMapping([&](const SMapping& mapping) {
        if (mapping.path[0] == '\0' || std::strncmp(mapping.path, "/dev/", 5) == 0) return;
        if (count > 0 && std::strcmp(g_modules[count - 1].mapping.path, mapping.path) == 0) {
            g_modules[count - 1].mapping.end = mapping.end;
            return;
        }
        if (mapping.offset != 0 || count == kMaxModules) return;
        g_modules[count].mapping = mapping;
        readBuildId(g_modules[count]);
        ++count;
    });
    return count;
}

SContext convertContext(const ucontext_t& from) {
    const greg_t* r = from.uc_mcontext.gregs;
    SContext to;
    to.segments[0] = static_cast<uint16_t>(r[REG_CSGSFS]);
    to.segments[4] = static_cast<uint16_t>(r[REG_CSGSFS] >> 16);
    to.segments[3] = static_cast<uint16_t>(r[REG_CSGSFS] >> 32);
    to.segments[5] = static_cast<uint16_t>(r[REG_CSGSFS] >> 48);
    to.eflags = static_cast<uint32_t>(r[REG_EFL]);
    to.rax = r[REG_RAX], to.rcx = r[REG_RCX], to.rdx = r[REG_RDX], to.rbx = r[REG_RBX];
    to.rsp = r[REG_RSP], to.rbp = r[REG_RBP], to.rsi = r[REG_RSI], to.rdi = r[REG_RDI];
    to.r8 = r[REG_R8], to.r9 = r[REG_R9], to.r10 = r[REG_R10], to.r11 = r[REG_R11];
    to.r12 = r[REG_R12], to.r13 = r[REG_R13], to.r14 = r[REG_R14], to.r15 = r[REG_R15];
    to.rip = r[REG_RIP];
    if (from.uc_mcontext.fpregs) {
        to.mxcsr = from.uc_mcontext.fpregs->mxcsr;
        static_assert(sizeof(*from.uc_mcontext.fpregs) == sizeof to.floatingPoint);
        std::memcpy(to.floatingPoint, from.uc_mcontext.fpregs, sizeof to.floatingPoint);
    }
    return to;
}

// The first readable mapping that ends above the address and starts less than 1 MiB above it.
SMapping findMapping(uintptr_t address) {
    constexpr uintptr_t kMostGuard = 1024 * 1024;
    SMapping found;
    forEachMapping([&](const SMapping& mapping) {
        if (found.end == 0 && mapping.isReadable && mapping.start < address + kMostGuard &&
            address < mapping.end)
            found = mapping;
    });
    return found;
}

// After an overflow the stack pointer is below the stack: in the guard area, which for all threads but the
// first is a mapping of its own, or in the alternate stack, which often lies directly below that area.
SMemory writeStack(CSafeWriter& out, uintptr_t stackPointer, const stack_t& alternate, uintptr_t stackLimit) {
    constexpr uintptr_t kRedZone = 128;
    SMapping stack = findMapping(stackPointer);
    if (stack.end == 0) return {};
    const uintptr_t alternateStart = reinterpret_cast<uintptr_t>(alternate.ss_sp);
    const uintptr_t alternateEnd = alternateStart + alternate.ss_size;
    if (stackPointer >= alternateStart && stackPointer < alternateEnd)
        stack.end = std::max(stack.end, findMapping(alternateEnd).end);
    if (stackPointer < stackLimit && stackLimit < stack.end) stack.end = stackLimit;
    const uintptr_t start = std::max(stack.start, stackPointer - kRedZone);
    const size_t size = std::min<size_t>(stack.end - start, kMaxStack);
    SMemory memory{start, {static_cast<uint32_t>(size), out.getPosition()}};
    out.writeMemory(start, size);
    return memory;
}

// A length in bytes, UTF-16 text and a terminator. Each byte of a path becomes one unit.
uint32_t writeName(CSafeWriter& out, std::string_view name) {
    const uint32_t position = out.getPosition();
    const uint32_t bytes = static_cast<uint32_t>(name.size() * 2);
    out.write(&bytes, sizeof bytes);
    for (size_t i = 0; i <= name.size(); ++i) {
        const char16_t unit = i < name.size() ? static_cast<unsigned char>(name[i]) : u'\0';
        out.write(&unit, sizeof unit);
    }
    return position;
}

template <class Record> SLocation writeList(CSafeWriter& out, const Record* records, size_t size) {
    const SLocation location{static_cast<uint32_t>(sizeof(uint32_t) + size * sizeof(Record)),
                             out.getPosition()};
    const uint32_t count = static_cast<uint32_t>(size);
    out.write(&count, sizeof count);
    out.write(records, size * sizeof(Record));
    return location;
}

SLocation writeProcFile(CSafeWriter& out, const char* path) {
    const uint32_t position = out.getPosition();
    out.writeFile(path);
    return {out.getPosition() - position, position};
}

} // namespace

void writeMiniDump(CSafeWriter& out, const siginfo_t& signal, const SThreadState* threads, size_t threadCount,
                   uintptr_t stackLimit) {
    SStream streams[7];
    SHeader header;
    header.streamCount = std::size(streams);
    header.time = static_cast<uint32_t>(std::time(nullptr));
    out.write(&header, sizeof header);
    out.write(streams, sizeof streams); // rewritten at the end, when their content is known

    threadCount = std::min(threadCount, kMaxThreads);
    for (size_t i = 0; i < threadCount; ++i) {
        SThread& record = g_threadRecords[i];
        record = SThread();
        record.id = static_cast<uint32_t>(threads[i].id);
        if (!threads[i].hasContext) continue;
        const SContext context = convertContext(threads[i].context);
        record.context = {sizeof context, out.getPosition()};
        out.write(&context, sizeof context);
        record.stack = writeStack(out, context.rsp, threads[i].context.uc_stack, stackLimit);
    }
    streams[0] = {kThreadList, writeList(out, g_threadRecords, threadCount)};

    const size_t moduleCount = collectModules();
    for (size_t i = 0; i < moduleCount; ++i) {
        const SLoadedModule& module = g_modules[i];
        SModule& record = g_moduleRecords[i];
        record = SModule();
        record.base = module.mapping.start;
        record.size = static_cast<uint32_t>(module.mapping.end - module.mapping.start);
        record.name = writeName(out, module.mapping.path);
        constexpr uint32_t kElfBuildId = 0x4270454c; // "BpEL"
        record.codeView = {static_cast<uint32_t>(sizeof kElfBuildId + module.buildIdSize), out.getPosition()};
        out.write(&kElfBuildId, sizeof kElfBuildId);
        out.write(module.buildId, module.buildIdSize);
    }
    streams[1] = {kModuleList, writeList(out, g_moduleRecords, moduleCount)};

    SMemory memory[kMaxThreads];
    size_t memoryCount = 0;
    for (size_t i = 0; i < threadCount; ++i)
        if (g_threadRecords[i].stack.location.size > 0) memory[memoryCount++] = g_threadRecords[i].stack;
    streams[2] = {kMemoryList, writeList(out, memory, memoryCount)};

    SException exception;
    exception.thread = static_cast<uint32_t>(threads[0].id);
    exception.code = static_cast<uint32_t>(signal.si_signo);
    exception.flags = static_cast<uint32_t>(signal.si_code);
    exception.address = reinterpret_cast<uintptr_t>(signal.si_addr);
    exception.context = g_threadRecords[0].context;
    streams[3] = {kException, {sizeof exception, out.getPosition()}};
    out.write(&exception, sizeof exception);

    SSystemInfo system;
    system.processors = static_cast<uint8_t>(std::min(::get_nprocs(), 255));
    system.servicePack = writeName(out, "");
    streams[4] = {kSystemInfo, {sizeof system, out.getPosition()}};
    out.write(&system, sizeof system);

    streams[5] = {kLinuxStatus, writeProcFile(out, "/proc/self/status")};
    streams[6] = {kLinuxMaps, writeProcFile(out, "/proc/self/maps")};
    out.writeAt(sizeof header, streams, sizeof streams);
}

} // namespace crashhandler
