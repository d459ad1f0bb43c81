// A plugin of qemu's user-mode emulator that counts what an ARM program executes between its last
// two marks, and prints the counts when the program ends. A mark is the instruction `dbg #7`, which
// does nothing. Debian ships no header of the plugin interface, so the required part is declared
// here.
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

enum Kind { INSTRUCTION, BARRIER, EXCLUSIVE, KINDS, MARK = KINDS };

// The counts of all threads of the program. They have no lock, so the program must not run two
// threads at the same time between its marks.
static uint64_t executed[KINDS], atMark[2][KINDS];

// Four-byte instructions as words in memory; in Thumb-2 the first halfword is the lower one. The
// emulator does not say which encoding a program uses, but it need not: a word that matches in one
// encoding is, in the other, a call or a coprocessor store that no compiler generates.
#define THUMB(word) ((word) << 16 | (word) >> 16)
static const struct {
    enum Kind kind;
    uint32_t mask;
    uint32_t bits;
} kPatterns[] = {
    {BARRIER, THUMB(0xFFFFFFE0u), THUMB(0xF3BF8F40u)},  // dsb, dmb
    {BARRIER, 0xFFFFFFE0u, 0xF57FF040u},
    {EXCLUSIVE, THUMB(0xFFF00F00u), THUMB(0xE8500F00u)},  // ldrex
    {EXCLUSIVE, THUMB(0xFFF00FEFu), THUMB(0xE8D00F4Fu)},  // ldrexb, ldrexh
    {EXCLUSIVE, THUMB(0xFFF000FFu), THUMB(0xE8D0007Fu)},  // ldrexd
    {EXCLUSIVE, 0x0F900FFFu, 0x01900F9Fu},                // all four sizes
    {MARK, 0xFFFFFFFFu, THUMB(0xF3AF80F7u)},
    {MARK, 0xFFFFFFFFu, 0xE320F0F7u},
};

static void Mark(unsigned int cpu, void *data) {
    (void)cpu;
    (void)data;
    memcpy(atMark[0], atMark[1], sizeof executed);
    memcpy(atMark[1], executed, sizeof executed);
}

static void CountTranslated(qemu_plugin_id_t id, struct qemu_plugin_tb *tb) {
    (void)id;
    uint64_t found[KINDS] = {[INSTRUCTION] = qemu_plugin_tb_n_insns(tb)};
    for (size_t i = 0; i < found[INSTRUCTION]; i++) {
        struct qemu_plugin_insn *insn = qemu_plugin_tb_get_insn(tb, i);
        uint32_t word = 0;
        if (qemu_plugin_insn_size(insn) != sizeof word) {
            continue;
        }
        memcpy(&word, qemu_plugin_insn_data(insn), sizeof word);
        for (size_t j = 0; j < sizeof kPatterns / sizeof kPatterns[0]; j++) {
            if ((word & kPatterns[j].mask) != kPatterns[j].bits) {
                continue;
            }
            if (kPatterns[j].kind == MARK) {
                qemu_plugin_register_vcpu_insn_exec_cb(insn, Mark, QEMU_PLUGIN_CB_NO_REGS, NULL);
            } else {
                found[kPatterns[j].kind]++;
            }
        }
    }
    for (size_t kind = 0; kind < KINDS; kind++) {
        if (found[kind] != 0) {
            qemu_plugin_register_vcpu_tb_exec_inline(tb, QEMU_PLUGIN_INLINE_ADD_U64,
                                                     &executed[kind], found[kind]);
        }
    }
}

static void PrintCounts(qemu_plugin_id_t id, void *data) {
    (void)id;
    (void)data;
    for (size_t kind = 0; kind < KINDS; kind++) {
        printf("%llu ", (unsigned long long)(atMark[1][kind] - atMark[0][kind]));
    }
    fflush(stdout);
}

EXPORT int qemu_plugin_version = 1;

EXPORT int qemu_plugin_install(qemu_plugin_id_t id, const void *info, int argc, char **argv);
int qemu_plugin_install(qemu_plugin_id_t id, const void *info, int argc, char **argv) {
    (void)info;
    (void)argc;
    (void)argv;
    qemu_plugin_register_vcpu_tb_trans_cb(id, CountTranslated);
    qemu_plugin_register_atexit_cb(id, PrintCounts, NULL);
    return 0;
}
