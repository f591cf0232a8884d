/* Checks the layout of the turbo-decoder model library's records (natural alignment; the
   32-bit build has 4-byte pointers), then links and calls the library. The expected offsets
   are written out by hand from the word tables, not derived from the header. Exits
   non-zero on the first mismatch, after printing it. */
#include <stdio.h>

#include "abi_expect.h"
#include "vexlon_ip_corvane_bitacc_cmodel.h"

static void check_generics(void) {
  SIZE(vexlon_ip_corvane_generics, 76, 76);
  FIELD(vexlon_ip_corvane_generics, max_block_size, 0, 0);
  FIELD(vexlon_ip_corvane_generics, processing_units, 16, 16);
  FIELD(vexlon_ip_corvane_generics, steps_per_unit, 20, 20);
  FIELD(vexlon_ip_corvane_generics, decoder_path, 24, 24);
  FIELD(vexlon_ip_corvane_generics, algorithm, 28, 28);
  FIELD(vexlon_ip_corvane_generics, extrinsic_bits, 32, 32);
  FIELD(vexlon_ip_corvane_generics, max_code_blocks, 36, 36);
  FIELD(vexlon_ip_corvane_generics, reserved_18, 72, 72);
}

static void check_inputs(void) {
  SIZE(vexlon_ip_corvane_inputs, 48, 72);
  FIELD(vexlon_ip_corvane_inputs, block_size, 0, 0);
  FIELD(vexlon_ip_corvane_inputs, iterations, 4, 4);
  FIELD(vexlon_ip_corvane_inputs, num_code_blocks, 8, 8);
  FIELD(vexlon_ip_corvane_inputs, reserved_3, 12, 12);
  FIELD(vexlon_ip_corvane_inputs, systematic, 16, 16);
  FIELD(vexlon_ip_corvane_inputs, systematic_size, 20, 24);
  FIELD(vexlon_ip_corvane_inputs, parity_1, 24, 32);
  FIELD(vexlon_ip_corvane_inputs, parity_1_size, 28, 40);
  FIELD(vexlon_ip_corvane_inputs, parity_2, 32, 48);
  FIELD(vexlon_ip_corvane_inputs, parity_2_size, 36, 56);
  FIELD(vexlon_ip_corvane_inputs, reserved_10, 40, 60);
  FIELD(vexlon_ip_corvane_inputs, reserved_11, 44, 64);
}

static void check_outputs(void) {
  SIZE(vexlon_ip_corvane_outputs, 16, 24);
  FIELD(vexlon_ip_corvane_outputs, iterations_done, 0, 0);
  FIELD(vexlon_ip_corvane_outputs, bits_stored, 4, 4);
  FIELD(vexlon_ip_corvane_outputs, bits, 8, 8);
  FIELD(vexlon_ip_corvane_outputs, bits_capacity, 12, 16);
}

static void check_calls(void) {
  vexlon_ip_corvane_generics generics = vexlon_ip_corvane_get_default_generics();
  vexlon_ip_corvane_state *state;
  if (generics.processing_units != 2 || generics.algorithm != 1 ||
      generics.max_block_size != 6144 || generics.extrinsic_bits != 10 ||
      generics.steps_per_unit != 32 || generics.decoder_path != 0 ||
      generics.max_code_blocks != 1) {
    printf("default generics are wrong\n");
    ++abi_failures;
  }
  state = vexlon_ip_corvane_create_state(generics);
  if (state == NULL || vexlon_ip_corvane_destroy_state(state) != 0) {
    printf("the default generics give no state\n");
    ++abi_failures;
  }
  generics.processing_units = 3;
  if (vexlon_ip_corvane_create_state(generics) != NULL) {
    printf("create_state accepted 3 processing units\n");
    ++abi_failures;
  }
  if (vexlon_ip_corvane_bitacc_simulate_batch(NULL, NULL, 1, NULL) !=
      VEXLON_IP_CORVANE_NULL_STATE) {
    printf("simulate_batch accepted a null state\n");
    ++abi_failures;
  }
}

int main(void) {
  check_generics();
  check_inputs();
  check_outputs();
  check_calls();
  printf("%d-bit corvane ABI check: %s\n", (int)(8 * sizeof(void *)),
         abi_failures == 0 ? "passed" : "FAILED");
  return abi_failures == 0 ? 0 : 1;
}
