/* Checks the layout of the turbo-decoder model library's records (natural alignment; the
 * 32-bit build has 4-byte pointers), then links and calls the library. The record sizes and
 * word orders are written out by hand from the word tables, not derived from the header.
 * Exits non-zero after printing every mismatch. */
#include <stdio.h>

#include "abi_expect.h"
#include "vexlon_ip_corvane_bitacc_cmodel.h"

static void check_records(void) {
  typedef vexlon_ip_corvane_generics G;
  typedef vexlon_ip_corvane_inputs I;
  typedef vexlon_ip_corvane_outputs O;
  const struct abi_field generics[] = {
      WORD(G, max_block_size),  WORD(G, reserved_1),       WORD(G, reserved_2),
      WORD(G, reserved_3),      WORD(G, processing_units), WORD(G, steps_per_unit),
      WORD(G, decoder_path),    WORD(G, algorithm),        WORD(G, extrinsic_bits),
      WORD(G, max_code_blocks), WORD(G, reserved_10),      WORD(G, reserved_11),
      WORD(G, reserved_12),     WORD(G, reserved_13),      WORD(G, reserved_14),
      WORD(G, reserved_15),     WORD(G, reserved_16),      WORD(G, reserved_17),
      WORD(G, reserved_18)};
  const struct abi_field inputs[] = {
      WORD(I, block_size),    WORD(I, iterations),    WORD(I, num_code_blocks),
      WORD(I, reserved_3),    PTR(I, systematic),     WORD(I, systematic_size),
      PTR(I, parity_1),       WORD(I, parity_1_size), PTR(I, parity_2),
      WORD(I, parity_2_size), WORD(I, reserved_10),   WORD(I, reserved_11)};
  const struct abi_field outputs[] = {WORD(O, iterations_done), WORD(O, bits_stored), PTR(O, bits),
                                      WORD(O, bits_capacity)};
  RECORD(vexlon_ip_corvane_generics, 76, 76, generics);
  RECORD(vexlon_ip_corvane_inputs, 48, 72, inputs);
  RECORD(vexlon_ip_corvane_outputs, 16, 24, outputs);
}

int main(void) {
  vexlon_ip_corvane_generics generics = vexlon_ip_corvane_get_default_generics();
  vexlon_ip_corvane_state *state = vexlon_ip_corvane_create_state(generics);
  check_records();
  expect_call(generics.processing_units == 2 && generics.algorithm == 1 &&
                  generics.max_block_size == 6144 && generics.extrinsic_bits == 10 &&
                  generics.steps_per_unit == 32 && generics.decoder_path == 0 &&
                  generics.max_code_blocks == 1,
              "default generics are wrong");
  expect_call(state != NULL && vexlon_ip_corvane_destroy_state(state) == 0,
              "the default generics give no state");
  generics.processing_units = 3;
  expect_call(vexlon_ip_corvane_create_state(generics) == NULL,
              "create_state accepted 3 processing units");
  return abi_report("corvane ABI");
}
