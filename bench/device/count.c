// A plugin of qemu's user-mode emulator. It counts what an ARM program executes between two marks,
// and writes the counts to a file when the program ends. A mark is the instruction `dbg #7`, which
// does nothing. Debian ships no header of the emulator's plugin interface, so the required part is
// declared here.
//   -plugin count.so,out=FILE
#include <stddef.h>
#include <stdint.h>
#include <stdio.h>
#include <string.h>

#define EXPORT __attribute__((visibility("default")))

typedef uint64_t qemu_plugin_id_t;
struct qemu_plugin_tb;
struct qemu_plugin_insn;
enum { QEMU_PLUGIN_INLINE_ADD_U64 = 0, QEMU_PLUGIN_CB_NO_REGS = 0 };
void qemu_plugin_register_vcpu_tb_trans_cb(qemu_plugin_id_t id,
                                           void (*callback)(qemu_plugin_id_t,
                                                            struct qemu_plugin_tb *));
void qemu_plugin_register_vcpu_tb_exec_inline(struct qemu_plugin_tb *tb, int operation,
                                              void *counter, uint64_t addend);
void qemu_plugin_register_vcpu_insn_exec_cb(struct qemu_plugin_insn *insn,
                                            void (*callback)(unsigned int cpu, void *), int flags,
                                            void *data);
void qemu_plugin_register_atexit_cb(qemu_plugin_id_t id, void (*callback)(qemu_plugin_id_t, void *),
                                    void *data);
size_t qemu_plugin_tb_n_insns(const struct qemu_plugin_tb *tb);
struct qemu_plugin_insn *qemu_plugin_tb_get_insn(const struct qemu_plugin_tb *tb, size_t index);
const void *qemu_plugin_insn_data(const struct qemu_plugin_insn *insn);
size_t qemu_plugin_insn_size(const struct qemu_plugin_insn *insn);

// The counts of all threads of the program. There is no lock, because only one thread may run at a
// time.
struct Counts {
    uint64_t instructions;
    uint64_t barriers;
    uint64_t exclusives;
};
static struct Counts executed;
static struct Counts atMark[2];
static size_t marks;

static char outPath[4096];

struct Kind {
    uint32_t mask;
    uint32_t bits;
};

static int IsOneOf(const struct Kind *kinds, size_t count, uint32_t word) {
    for (size_t i = 0; i < count; i++) {
        if ((word & kinds[i].mask) == kinds[i].bits) {
            return 1;
        }
    }
    return 0;
}

// Patterns of instructions of four bytes: in Thumb-2, with the first halfword in the upper half,
// and in ARM. The emulator does not say which encoding a program uses. That does not matter: a word
// that matches in one encoding is, in the other one, a call or a coprocessor store that no compiler
// generates.
static const struct Kind kBarriers[] = {
    {0xFFFFFFE0u, 0xF3BF8F40u},  // dsb, dmb
};
static const struct Kind kArmBarriers[] = {
    {0xFFFFFFE0u, 0xF57FF040u},
};
static const struct Kind kExclusives[] = {
    {0xFFF00F00u, 0xE8500F00u},  // ldrex
    {0xFFF00FEFu, 0xE8D00F4Fu},  // ldrexb, ldrexh
    {0xFFF000FFu, 0xE8D0007Fu},  // ldrexd
};
static const struct Kind kArmExclusives[] = {
    {0x0F900FFFu, 0x01900F9Fu},  // all four sizes
};
static const struct Kind kMark[] = {{0xFFFFFFFFu, 0xF3AF80F7u}};
static const struct Kind kArmMark[] = {{0xFFFFFFFFu, 0xE320F0F7u}};
#define IS_ONE_OF(kinds, word) IsOneOf(kinds, sizeof(kinds) / sizeof((kinds)[0]), word)

static void Mark(unsigned int cpu, void *data) {
    (void)cpu;
    (void)data;
    if (marks < 2) {
        atMark[marks++] = executed;
    }
}

static void CountTranslated(qemu_plugin_id_t id, struct qemu_plugin_tb *tb) {
    (void)id;
    const size_t count = qemu_plugin_tb_n_insns(tb);
    uint64_t barriers = 0;
    uint64_t exclusives = 0;
    for (size_t i = 0; i < count; i++) {
        struct qemu_plugin_insn *insn = qemu_plugin_tb_get_insn(tb, i);
        if (qemu_plugin_insn_size(insn) != 4) {
            continue;
        }
        uint32_t arm = 0;
        memcpy(&arm, qemu_plugin_insn_data(insn), sizeof arm);
        const uint32_t thumb = arm << 16 | arm >> 16;
        barriers += IS_ONE_OF(kBarriers, thumb) || IS_ONE_OF(kArmBarriers, arm);
        exclusives += IS_ONE_OF(kExclusives, thumb) || IS_ONE_OF(kArmExclusives, arm);
        if (IS_ONE_OF(kMark, thumb) || IS_ONE_OF(kArmMark, arm)) {
            qemu_plugin_register_vcpu_insn_exec_cb(insn, Mark, QEMU_PLUGIN_CB_NO_REGS, NULL);
        }
    }
    const struct {
        uint64_t *counter;
        uint64_t addend;
    } additions[] = {{&executed.instructions, count},
                     {&executed.barriers, barriers},
                     {&executed.exclusives, exclusives}};
    for (size_t i = 0; i < sizeof additions / sizeof additions[0]; i++) {
        if (additions[i].addend != 0) {
            qemu_plugin_register_vcpu_tb_exec_inline(tb, QEMU_PLUGIN_INLINE_ADD_U64,
                                                     additions[i].counter, additions[i].addend);
        }
    }
}

static void WriteCounts(qemu_plugin_id_t id, void *data) {
    (void)id;
    (void)data;
    if (marks != 2) {
        return;
    }
    FILE *out = fopen(outPath, "w");
    if (out == NULL) {
        perror(outPath);
        return;
    }
    fprintf(out, "%llu %llu %llu\n",
            (unsigned long long)(atMark[1].instructions - atMark[0].instructions),
            (unsigned long long)(atMark[1].barriers - atMark[0].barriers),
            (unsigned long long)(atMark[1].exclusives - atMark[0].exclusives));
    fclose(out);
}

EXPORT int qemu_plugin_version = 1;

EXPORT int qemu_plugin_install(qemu_plugin_id_t id, const void *info, int argc, char **argv);
int qemu_plugin_install(qemu_plugin_id_t id, const void *info, int argc, char **argv) {
    (void)info;
    if (argc != 1 || sscanf(argv[0], "out=%4095s", outPath) != 1) {
        fprintf(stderr, "count.so takes out=FILE\n");
        return -1;
    }
    qemu_plugin_register_vcpu_tb_trans_cb(id, CountTranslated);
    qemu_plugin_register_atexit_cb(id, WriteCounts, NULL);
    return 0;
}
