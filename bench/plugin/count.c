// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// A plugin of qemu-aarch64 that counts the instructions of stretches of a program, exactly, and where they
// ran.
//
//   qemu-aarch64 -plugin libcount.so,out=FILE program...
//
// The program divides its run into laps with a marker, the instruction `hint #112`, which no processor knows
// and all ignore. Each lap, from one marker to the next, is written to FILE when it ends:
//
//   lap INSTRUCTIONS
//   block ID EXECUTIONS        for every translation block that ran in it
//
// and the blocks at the end of the run:
//
//   code ID ADDRESS WORD...    the block's instructions, in hexadecimal
//
// A translation block is what the emulator runs as a whole: it ends at a branch or at the end of a page. It
// is counted when it is entered, so the block of a marker belongs to the lap that the marker ends; a program
// that subtracts one lap from another need not care.

#define _GNU_SOURCE  // RTLD_DEFAULT

#include <dlfcn.h>
#include <inttypes.h>
#include <stdbool.h>
#include <stddef.h>
#include <stdint.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>

// The emulator's plugin interface, as far as it is used here, in both of its forms: version 1 (before QEMU 9)
// and version 3 (from 9.1 on; the 2 in between is refused by the emulator). No package brings it as a header.
typedef uint64_t qemu_plugin_id_t;
struct qemu_info;
struct qemu_plugin_tb;
struct qemu_plugin_insn;
struct qemu_plugin_scoreboard;
enum qemu_plugin_op { QEMU_PLUGIN_INLINE_ADD_U64 };
enum qemu_plugin_cb_flags { QEMU_PLUGIN_CB_NO_REGS };
typedef void (*qemu_plugin_vcpu_tb_trans_cb_t)(qemu_plugin_id_t id, struct qemu_plugin_tb* tb);
typedef void (*qemu_plugin_vcpu_udata_cb_t)(unsigned int vcpu_index, void* userdata);
typedef void (*qemu_plugin_udata_cb_t)(qemu_plugin_id_t id, void* userdata);
extern void qemu_plugin_register_vcpu_tb_trans_cb(qemu_plugin_id_t id,
                                                  qemu_plugin_vcpu_tb_trans_cb_t callback);
extern void qemu_plugin_register_atexit_cb(qemu_plugin_id_t id, qemu_plugin_udata_cb_t callback,
                                           void* userdata);
extern void qemu_plugin_register_vcpu_insn_exec_cb(struct qemu_plugin_insn* insn,
                                                   qemu_plugin_vcpu_udata_cb_t callback,
                                                   enum qemu_plugin_cb_flags flags, void* userdata);
extern size_t qemu_plugin_tb_n_insns(const struct qemu_plugin_tb* tb);
extern uint64_t qemu_plugin_tb_vaddr(const struct qemu_plugin_tb* tb);
extern struct qemu_plugin_insn* qemu_plugin_tb_get_insn(const struct qemu_plugin_tb* tb, size_t index);

// Version 1 alone: a counter is a number of the plugin's, and instructions are where the emulator has them.
#define WEAK __attribute__((weak))
WEAK extern void qemu_plugin_register_vcpu_tb_exec_inline(struct qemu_plugin_tb* tb, enum qemu_plugin_op op,
                                                          void* counter, uint64_t addend);
typedef const void* (*insn_data_1)(const struct qemu_plugin_insn* insn);

// Version 3 alone: a counter is a place in an array that each processor has its own of, and instructions are
// copied.
typedef struct {
  struct qemu_plugin_scoreboard* score;
  size_t offset;
} qemu_plugin_u64;
WEAK extern struct qemu_plugin_scoreboard* qemu_plugin_scoreboard_new(size_t element_size);
WEAK extern uint64_t qemu_plugin_u64_sum(qemu_plugin_u64 entry);
WEAK extern void qemu_plugin_register_vcpu_tb_exec_inline_per_vcpu(struct qemu_plugin_tb* tb,
                                                                   enum qemu_plugin_op op,
                                                                   qemu_plugin_u64 entry, uint64_t addend);
typedef size_t (*insn_data_3)(const struct qemu_plugin_insn* insn, void* data, size_t size);

#define EXPORTED __attribute__((visibility("default")))

EXPORTED extern int qemu_plugin_version;
EXPORTED int qemu_plugin_install(qemu_plugin_id_t id, const struct qemu_info* info, int argc, char** argv);

// Read before anything of this library is called, but for what runs when it is loaded.
int qemu_plugin_version;

static union {
  void* symbol;
  insn_data_1 of_version_1;
  insn_data_3 of_version_3;
} insn_data;

__attribute__((constructor)) static void choose_version(void) {
  qemu_plugin_version = qemu_plugin_register_vcpu_tb_exec_inline != NULL ? 1 : 3;
  insn_data.symbol = dlsym(RTLD_DEFAULT, "qemu_plugin_insn_data");
}

static const uint32_t kMarker = 0xd5032e1f;  // hint #112

struct block {
  struct block* next;  // in the bucket
  uint64_t address;
  size_t length;      // instructions
  union {             // incremented by the emulated code itself
    uint64_t number;  // of version 1
    qemu_plugin_u64 entry;
  } executions;
  uint64_t before;  // executions when the lap began
  size_t id;
  uint32_t words[];
};

enum { kBuckets = 1 << 16 };
static struct block* buckets[kBuckets];
static struct block** blocks;  // by id
static size_t block_count;
static size_t block_capacity;
static FILE* out;

static void* checked(void* memory) {
  if (memory == NULL) {
    fputs("count: out of memory\n", stderr);
    abort();
  }
  return memory;
}

static uint64_t executions_of(const struct block* block) {
  return qemu_plugin_version == 1 ? block->executions.number : qemu_plugin_u64_sum(block->executions.entry);
}

// Version 3 hands counters out by the thousand.
static qemu_plugin_u64 new_entry(size_t id) {
  enum { kEntries = 4096 };
  static struct qemu_plugin_scoreboard* score;
  if (id % kEntries == 0) {
    score = qemu_plugin_scoreboard_new(kEntries * sizeof(uint64_t));
  }
  return (qemu_plugin_u64){score, id % kEntries * sizeof(uint64_t)};
}

static struct block* new_block(uint64_t address, size_t length, const uint32_t* words) {
  if (block_count == block_capacity) {
    block_capacity = block_capacity == 0 ? 4096 : 2 * block_capacity;
    blocks = checked(realloc(blocks, block_capacity * sizeof(*blocks)));
  }
  struct block* block = checked(calloc(1, sizeof(*block) + length * sizeof(*words)));
  block->address = address;
  block->length = length;
  memcpy(block->words, words, length * sizeof(*words));
  block->id = block_count;
  if (qemu_plugin_version != 1) {
    block->executions.entry = new_entry(block->id);
  }
  blocks[block_count++] = block;
  return block;
}

// The record of a block. A block may be translated more than once; it is one block all the same.
static struct block* block_of(const struct qemu_plugin_tb* tb) {
  enum { kMostInstructions = 1024 };
  uint32_t words[kMostInstructions];
  const uint64_t address = qemu_plugin_tb_vaddr(tb);
  const size_t length = qemu_plugin_tb_n_insns(tb);
  if (length > kMostInstructions) {
    fputs("count: a block is longer than any should be\n", stderr);
    abort();
  }
  for (size_t i = 0; i < length; ++i) {
    const struct qemu_plugin_insn* insn = qemu_plugin_tb_get_insn(tb, i);
    if (qemu_plugin_version == 1) {
      memcpy(&words[i], insn_data.of_version_1(insn), sizeof(words[i]));
    } else {
      insn_data.of_version_3(insn, &words[i], sizeof(words[i]));
    }
  }
  struct block** link = &buckets[address / sizeof(uint32_t) % kBuckets];
  for (; *link != NULL; link = &(*link)->next) {
    if ((*link)->address == address && (*link)->length == length &&
        memcmp((*link)->words, words, length * sizeof(*words)) == 0) {
      return *link;
    }
  }
  *link = new_block(address, length, words);
  return *link;
}

static void on_marker(unsigned int vcpu_index, void* userdata) {
  (void)vcpu_index;
  (void)userdata;
  uint64_t instructions = 0;
  for (size_t i = 0; i < block_count; ++i) {
    instructions += (executions_of(blocks[i]) - blocks[i]->before) * blocks[i]->length;
  }
  fprintf(out, "lap %" PRIu64 "\n", instructions);
  for (size_t i = 0; i < block_count; ++i) {
    struct block* block = blocks[i];
    const uint64_t executions = executions_of(block);
    if (executions != block->before) {
      fprintf(out, "block %zu %" PRIu64 "\n", block->id, executions - block->before);
      block->before = executions;
    }
  }
}

static void on_translation(qemu_plugin_id_t id, struct qemu_plugin_tb* tb) {
  (void)id;
  struct block* block = block_of(tb);
  if (qemu_plugin_version == 1) {
    qemu_plugin_register_vcpu_tb_exec_inline(tb, QEMU_PLUGIN_INLINE_ADD_U64, &block->executions.number, 1);
  } else {
    qemu_plugin_register_vcpu_tb_exec_inline_per_vcpu(tb, QEMU_PLUGIN_INLINE_ADD_U64, block->executions.entry,
                                                      1);
  }
  for (size_t i = 0; i < block->length; ++i) {
    if (block->words[i] == kMarker) {
      qemu_plugin_register_vcpu_insn_exec_cb(qemu_plugin_tb_get_insn(tb, i), on_marker,
                                             QEMU_PLUGIN_CB_NO_REGS, NULL);
    }
  }
}

static void on_exit_of_program(qemu_plugin_id_t id, void* userdata) {
  (void)id;
  (void)userdata;
  for (size_t i = 0; i < block_count; ++i) {
    fprintf(out, "code %zu %" PRIx64, blocks[i]->id, blocks[i]->address);
    for (size_t k = 0; k < blocks[i]->length; ++k) {
      fprintf(out, " %08" PRIx32, blocks[i]->words[k]);
    }
    fputc('\n', out);
  }
  fclose(out);
}

int qemu_plugin_install(qemu_plugin_id_t id, const struct qemu_info* info, int argc, char** argv) {
  (void)info;
  static const char kOut[] = "out=";
  for (int i = 0; i < argc; ++i) {
    if (strncmp(argv[i], kOut, sizeof(kOut) - 1) == 0) {
      out = fopen(argv[i] + sizeof(kOut) - 1, "w");
    }
  }
  if (out == NULL) {
    fputs("count: out=FILE is missing, or cannot be written\n", stderr);
    return -1;
  }
  qemu_plugin_register_vcpu_tb_trans_cb(id, on_translation);
  qemu_plugin_register_atexit_cb(id, on_exit_of_program, NULL);
  return 0;
}
