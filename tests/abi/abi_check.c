/* Checks the layout of every interface record against the contract (natural alignment;
   the 32-bit contract build has 4-byte pointers), then links and calls the shared library.
   The expected offsets are written out by hand from the record tables, not derived from
   the header. Exits non-zero on the first mismatch, after printing it. */
#include <stdio.h>

#include "abi_expect.h"
#include "vexlon_ip_brannoc_bitacc_cmodel.h"

static void check_generics(void) {
  SIZE(vexlon_ip_brannoc_generics, 16, 16);
  FIELD(vexlon_ip_brannoc_generics, C_NUM_PU, 0, 0);
  FIELD(vexlon_ip_brannoc_generics, C_ALGORITHM_TYPE, 4, 4);
  FIELD(vexlon_ip_brannoc_generics, C_INTERLEAVER_BUFFER_SIZE, 8, 8);
  FIELD(vexlon_ip_brannoc_generics, C_NUM_CQI_PU, 12, 12);
}

static void check_sch_control(void) {
  SIZE(vexlon_ip_brannoc_SCH_controlData, 92, 92);
  FIELD(vexlon_ip_brannoc_SCH_controlData, SCH_CQI_IP_SIZE, 0, 0);
  FIELD(vexlon_ip_brannoc_SCH_controlData, SCH_CQI_OP_SIZE, 4, 4);
  FIELD(vexlon_ip_brannoc_SCH_controlData, SCH_IP_DATA_TYPE, 8, 8);
  FIELD(vexlon_ip_brannoc_SCH_controlData, SCH_ACK_IP_SIZE, 12, 12);
  FIELD(vexlon_ip_brannoc_SCH_controlData, SCH_ACK_OP_SIZE, 16, 16);
  FIELD(vexlon_ip_brannoc_SCH_controlData, SCH_RI_IP_SIZE, 20, 20);
  FIELD(vexlon_ip_brannoc_SCH_controlData, SCH_RI_OP_SIZE, 24, 24);
  FIELD(vexlon_ip_brannoc_SCH_controlData, SCH_RM_E_IDX, 28, 28);
  FIELD(vexlon_ip_brannoc_SCH_controlData, SCH_CH_INT_ROWS, 32, 32);
  FIELD(vexlon_ip_brannoc_SCH_controlData, SCH_CP, 36, 36);
  FIELD(vexlon_ip_brannoc_SCH_controlData, SCH_RM_E_MINUS, 40, 40);
  FIELD(vexlon_ip_brannoc_SCH_controlData, SCH_RM_E_PLUS, 44, 44);
  FIELD(vexlon_ip_brannoc_SCH_controlData, SCH_TBSIZE, 48, 48);
  FIELD(vexlon_ip_brannoc_SCH_controlData, SCH_TD_ITER, 52, 52);
  FIELD(vexlon_ip_brannoc_SCH_controlData, SCH_QAM, 56, 56);
  FIELD(vexlon_ip_brannoc_SCH_controlData, SCH_USER_ID, 60, 60);
  FIELD(vexlon_ip_brannoc_SCH_controlData, SCH_SFRM, 64, 64);
  FIELD(vexlon_ip_brannoc_SCH_controlData, SCH_HARQ_SFRM, 68, 68);
  FIELD(vexlon_ip_brannoc_SCH_controlData, SCH_RV, 72, 72);
  FIELD(vexlon_ip_brannoc_SCH_controlData, SCH_ND, 76, 76);
  FIELD(vexlon_ip_brannoc_SCH_controlData, SCH_HFC, 80, 80);
  FIELD(vexlon_ip_brannoc_SCH_controlData, SCH_TD_FLUSH, 84, 84);
  FIELD(vexlon_ip_brannoc_SCH_controlData, SCH_TAG, 88, 88);
}

static void check_sch_inputs(void) {
  SIZE(vexlon_ip_brannoc_SCH_inputs, 116, 136);
  FIELD(vexlon_ip_brannoc_SCH_inputs, tb_llr, 0, 0);
  FIELD(vexlon_ip_brannoc_SCH_inputs, sys_harq_buffer, 4, 8);
  FIELD(vexlon_ip_brannoc_SCH_inputs, p0_harq_buffer, 8, 16);
  FIELD(vexlon_ip_brannoc_SCH_inputs, p1_harq_buffer, 12, 24);
  FIELD(vexlon_ip_brannoc_SCH_inputs, llr_size, 16, 32);
  FIELD(vexlon_ip_brannoc_SCH_inputs, harq_buffer_size, 20, 36);
  FIELD(vexlon_ip_brannoc_SCH_inputs, controlData, 24, 40);
}

static void check_sch_outputs(void) {
  SIZE(vexlon_ip_brannoc_SCH_outputs, 92, 128);
  FIELD(vexlon_ip_brannoc_SCH_outputs, SCH_data_out, 0, 0);
  FIELD(vexlon_ip_brannoc_SCH_outputs, SCH_ACK_out, 4, 8);
  FIELD(vexlon_ip_brannoc_SCH_outputs, SCH_RI_out, 8, 16);
  FIELD(vexlon_ip_brannoc_SCH_outputs, SCH_CQI_out, 12, 24);
  FIELD(vexlon_ip_brannoc_SCH_outputs, sys_harq_buffer, 16, 32);
  FIELD(vexlon_ip_brannoc_SCH_outputs, p0_harq_buffer, 20, 40);
  FIELD(vexlon_ip_brannoc_SCH_outputs, p1_harq_buffer, 24, 48);
  FIELD(vexlon_ip_brannoc_SCH_outputs, SCH_TB_crc_error, 28, 56);
  FIELD(vexlon_ip_brannoc_SCH_outputs, CW_CRC_out, 32, 64);
  FIELD(vexlon_ip_brannoc_SCH_outputs, SCH_CQI_crc_error, 36, 72);
  FIELD(vexlon_ip_brannoc_SCH_outputs, SCH_ACK_parity_error, 37, 73);
  FIELD(vexlon_ip_brannoc_SCH_outputs, SCH_RI_parity_error, 38, 74);
  FIELD(vexlon_ip_brannoc_SCH_outputs, max_harq_buffer_size, 40, 76);
  FIELD(vexlon_ip_brannoc_SCH_outputs, max_SCH_data_out_size, 44, 80);
  FIELD(vexlon_ip_brannoc_SCH_outputs, max_SCH_ACK_out_size, 48, 84);
  FIELD(vexlon_ip_brannoc_SCH_outputs, max_SCH_RI_out_size, 52, 88);
  FIELD(vexlon_ip_brannoc_SCH_outputs, max_SCH_CQI_out_size, 56, 92);
  FIELD(vexlon_ip_brannoc_SCH_outputs, max_CW_CRC_out_size, 60, 96);
  FIELD(vexlon_ip_brannoc_SCH_outputs, harq_buffer_out_size, 64, 100);
  FIELD(vexlon_ip_brannoc_SCH_outputs, SCH_data_out_size, 68, 104);
  FIELD(vexlon_ip_brannoc_SCH_outputs, SCH_ACK_out_size, 72, 108);
  FIELD(vexlon_ip_brannoc_SCH_outputs, SCH_RI_out_size, 76, 112);
  FIELD(vexlon_ip_brannoc_SCH_outputs, SCH_CQI_out_size, 80, 116);
  FIELD(vexlon_ip_brannoc_SCH_outputs, CW_CRC_out_size, 84, 120);
  FIELD(vexlon_ip_brannoc_SCH_outputs, SCH_TAG_out, 88, 124);
}

static void check_cch(void) {
  SIZE(vexlon_ip_brannoc_CCH_controlData, 20, 20);
  FIELD(vexlon_ip_brannoc_CCH_controlData, CCH_UCI_OP_SIZE, 0, 0);
  FIELD(vexlon_ip_brannoc_CCH_controlData, CCH_CP, 4, 4);
  FIELD(vexlon_ip_brannoc_CCH_controlData, CCH_ACK_OP_SIZE, 8, 8);
  FIELD(vexlon_ip_brannoc_CCH_controlData, CCH_USER_ID, 12, 12);
  FIELD(vexlon_ip_brannoc_CCH_controlData, CCH_TAG, 16, 16);

  SIZE(vexlon_ip_brannoc_CCH_inputs, 28, 32);
  FIELD(vexlon_ip_brannoc_CCH_inputs, llr, 0, 0);
  FIELD(vexlon_ip_brannoc_CCH_inputs, llr_size, 4, 8);
  FIELD(vexlon_ip_brannoc_CCH_inputs, controlData, 8, 12);

  SIZE(vexlon_ip_brannoc_CCH_outputs, 28, 40);
  FIELD(vexlon_ip_brannoc_CCH_outputs, CCH_data_out, 0, 0);
  FIELD(vexlon_ip_brannoc_CCH_outputs, CCH_ACK_out, 4, 8);
  FIELD(vexlon_ip_brannoc_CCH_outputs, max_CCH_data_out_size, 8, 16);
  FIELD(vexlon_ip_brannoc_CCH_outputs, max_CCH_ACK_out_size, 12, 20);
  FIELD(vexlon_ip_brannoc_CCH_outputs, CCH_data_out_size, 16, 24);
  FIELD(vexlon_ip_brannoc_CCH_outputs, CCH_ACK_out_size, 20, 28);
  FIELD(vexlon_ip_brannoc_CCH_outputs, CCH_TAG_out, 24, 32);
}

static void check_calls(void) {
  vexlon_ip_brannoc_generics generics = vexlon_ip_brannoc_get_default_generics();
  if (generics.C_NUM_PU != 2 || generics.C_ALGORITHM_TYPE != 1 ||
      generics.C_INTERLEAVER_BUFFER_SIZE != 36864 || generics.C_NUM_CQI_PU != 1) {
    printf("default generics are wrong\n");
    ++abi_failures;
  }
  generics.C_NUM_PU = 3;
  if (vexlon_ip_brannoc_create_state(generics) != NULL) {
    printf("create_state accepted C_NUM_PU 3\n");
    ++abi_failures;
  }
  vexlon_ip_brannoc_destroy_state(NULL);
  if (IUO_set_debugfn_state(NULL, 33, 0, "x", 1) != 0) {
    printf("IUO_set_debugfn_state accepted key 33\n");
    ++abi_failures;
  }
}

int main(void) {
  check_generics();
  check_sch_control();
  check_sch_inputs();
  check_sch_outputs();
  check_cch();
  check_calls();
  printf("%d-bit ABI check: %s\n", (int)(8 * sizeof(void *)),
         abi_failures == 0 ? "passed" : "FAILED");
  return abi_failures == 0 ? 0 : 1;
}
