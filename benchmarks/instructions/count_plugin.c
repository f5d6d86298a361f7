/*
 * A plugin for QEMU's user-mode emulators: counts how often each translation block starts. At exit
 * it writes one line per block, "address instructions executions", to the file named by out=FILE.
 *
 *   qemu-arm -plugin count_plugin.so,out=FILE program...
 */
#include <inttypes.h>
#include <stdint.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>

/* The part of version 1 of the plugin interface that is used here; distributions do not package its
 * header. */
typedef uint64_t qemu_plugin_id_t;
struct qemu_plugin_tb;
struct qemu_info;
enum qemu_plugin_op { QEMU_PLUGIN_INLINE_ADD_U64 };
void qemu_plugin_register_vcpu_tb_trans_cb(qemu_plugin_id_t id,
                                           void (*callback)(qemu_plugin_id_t,
                                                            struct qemu_plugin_tb*));
void qemu_plugin_register_vcpu_tb_exec_inline(struct qemu_plugin_tb* tb, enum qemu_plugin_op op,
                                              void* counter, uint64_t addend);
void qemu_plugin_register_atexit_cb(qemu_plugin_id_t id, void (*callback)(qemu_plugin_id_t, void*),
                                    void* data);
size_t qemu_plugin_tb_n_insns(const struct qemu_plugin_tb* tb);
uint64_t qemu_plugin_tb_vaddr(const struct qemu_plugin_tb* tb);

#define EXPORT __attribute__((visibility("default")))
EXPORT extern const int qemu_plugin_version;
EXPORT int qemu_plugin_install(qemu_plugin_id_t id, const struct qemu_info* info, int argc,
                               char** argv);
const int qemu_plugin_version = 1;

struct Block {
  struct Block* next;
  uint64_t address;
  size_t instructions;
  uint64_t executions;
};

static struct Block* blocks;
static FILE* out;

/* A block that is translated again is counted as one more. Emulated programs have one thread. */
static void OnTranslation(qemu_plugin_id_t id, struct qemu_plugin_tb* tb) {
  (void)id;
  struct Block* const block = malloc(sizeof(*block));
  if (block == NULL) abort();
  *block = (struct Block){blocks, qemu_plugin_tb_vaddr(tb), qemu_plugin_tb_n_insns(tb), 0};
  blocks = block;
  qemu_plugin_register_vcpu_tb_exec_inline(tb, QEMU_PLUGIN_INLINE_ADD_U64, &block->executions, 1);
}

static void OnExit(qemu_plugin_id_t id, void* data) {
  (void)id;
  (void)data;
  for (const struct Block* block = blocks; block != NULL; block = block->next) {
    fprintf(out, "%" PRIu64 " %zu %" PRIu64 "\n", block->address, block->instructions,
            block->executions);
  }
  if (fclose(out) != 0) perror("count_plugin");
}

int qemu_plugin_install(qemu_plugin_id_t id, const struct qemu_info* info, int argc, char** argv) {
  (void)info;
  if (argc != 1 || strncmp(argv[0], "out=", 4) != 0) {
    fputs("count_plugin: out=FILE is missing\n", stderr);
    return 1;
  }
  out = fopen(argv[0] + 4, "w");
  if (out == NULL) {
    perror(argv[0] + 4);
    return 1;
  }
  qemu_plugin_register_vcpu_tb_trans_cb(id, OnTranslation);
  qemu_plugin_register_atexit_cb(id, OnExit, NULL);
  return 0;
}
