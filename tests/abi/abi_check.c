/* Checks the layout of every interface record against the contract (natural alignment;
 * the 32-bit contract build has 4-byte pointers), then links and calls the shared library.
 * The record sizes and field orders are written out by hand from the record tables, not
 * derived from the header. Exits non-zero after printing every mismatch. */
#include <stdio.h>

#include "abi_expect.h"
#include "vexlon_ip_brannoc_bitacc_cmodel.h"

static void check_generics(void) {
  typedef vexlon_ip_brannoc_generics R;
  const struct abi_field fields[] = {WORD(R, C_NUM_PU), WORD(R, C_ALGORITHM_TYPE),
                                     WORD(R, C_INTERLEAVER_BUFFER_SIZE), WORD(R, C_NUM_CQI_PU)};
  RECORD(vexlon_ip_brannoc_generics, 16, 16, fields);
}

static void check_sch(void) {
  typedef vexlon_ip_brannoc_SCH_controlData R;
  typedef vexlon_ip_brannoc_SCH_inputs I;
  typedef vexlon_ip_brannoc_SCH_outputs O;
  const struct abi_field control[] = {
      WORD(R, SCH_CQI_IP_SIZE), WORD(R, SCH_CQI_OP_SIZE), WORD(R, SCH_IP_DATA_TYPE),
      WORD(R, SCH_ACK_IP_SIZE), WORD(R, SCH_ACK_OP_SIZE), WORD(R, SCH_RI_IP_SIZE),
      WORD(R, SCH_RI_OP_SIZE),  WORD(R, SCH_RM_E_IDX),    WORD(R, SCH_CH_INT_ROWS),
      WORD(R, SCH_CP),          WORD(R, SCH_RM_E_MINUS),  WORD(R, SCH_RM_E_PLUS),
      WORD(R, SCH_TBSIZE),      WORD(R, SCH_TD_ITER),     WORD(R, SCH_QAM),
      WORD(R, SCH_USER_ID),     WORD(R, SCH_SFRM),        WORD(R, SCH_HARQ_SFRM),
      WORD(R, SCH_RV),          WORD(R, SCH_ND),          WORD(R, SCH_HFC),
      WORD(R, SCH_TD_FLUSH),    WORD(R, SCH_TAG)};
  const struct abi_field inputs[] = {
      PTR(I, tb_llr),    PTR(I, sys_harq_buffer),   PTR(I, p0_harq_buffer), PTR(I, p1_harq_buffer),
      WORD(I, llr_size), WORD(I, harq_buffer_size), WORD(I, controlData)};
  /* clang-format off */
  const struct abi_field outputs[] = {
      PTR(O, SCH_data_out),           PTR(O, SCH_ACK_out),            PTR(O, SCH_RI_out),
      PTR(O, SCH_CQI_out),            PTR(O, sys_harq_buffer),        PTR(O, p0_harq_buffer),
      PTR(O, p1_harq_buffer),         BYTE(O, SCH_TB_crc_error),      PTR(O, CW_CRC_out),
      BYTE(O, SCH_CQI_crc_error),     BYTE(O, SCH_ACK_parity_error),  BYTE(O, SCH_RI_parity_error),
      WORD(O, max_harq_buffer_size),  WORD(O, max_SCH_data_out_size), WORD(O, max_SCH_ACK_out_size),
      WORD(O, max_SCH_RI_out_size),   WORD(O, max_SCH_CQI_out_size),  WORD(O, max_CW_CRC_out_size),
      WORD(O, harq_buffer_out_size),  WORD(O, SCH_data_out_size),     WORD(O, SCH_ACK_out_size),
      WORD(O, SCH_RI_out_size),       WORD(O, SCH_CQI_out_size),      WORD(O, CW_CRC_out_size),
      WORD(O, SCH_TAG_out)};
  /* clang-format on */
  RECORD(vexlon_ip_brannoc_SCH_controlData, 92, 92, control);
  RECORD(vexlon_ip_brannoc_SCH_inputs, 116, 136, inputs);
  RECORD(vexlon_ip_brannoc_SCH_outputs, 92, 128, outputs);
}

static void check_cch(void) {
  typedef vexlon_ip_brannoc_CCH_controlData R;
  typedef vexlon_ip_brannoc_CCH_inputs I;
  typedef vexlon_ip_brannoc_CCH_outputs O;
  const struct abi_field control[] = {WORD(R, CCH_UCI_OP_SIZE), WORD(R, CCH_CP),
                                      WORD(R, CCH_ACK_OP_SIZE), WORD(R, CCH_USER_ID),
                                      WORD(R, CCH_TAG)};
  const struct abi_field inputs[] = {PTR(I, llr), WORD(I, llr_size), WORD(I, controlData)};
  const struct abi_field outputs[] = {
      PTR(O, CCH_data_out),          PTR(O, CCH_ACK_out),        WORD(O, max_CCH_data_out_size),
      WORD(O, max_CCH_ACK_out_size), WORD(O, CCH_data_out_size), WORD(O, CCH_ACK_out_size),
      WORD(O, CCH_TAG_out)};
  RECORD(vexlon_ip_brannoc_CCH_controlData, 20, 20, control);
  RECORD(vexlon_ip_brannoc_CCH_inputs, 28, 32, inputs);
  RECORD(vexlon_ip_brannoc_CCH_outputs, 28, 40, outputs);
}

int main(void) {
  vexlon_ip_brannoc_generics generics = vexlon_ip_brannoc_get_default_generics();
  check_generics();
  check_sch();
  check_cch();
  expect_call(generics.C_NUM_PU == 2 && generics.C_ALGORITHM_TYPE == 1 &&
                  generics.C_INTERLEAVER_BUFFER_SIZE == 36864 && generics.C_NUM_CQI_PU == 1,
              "default generics are wrong");
  generics.C_NUM_PU = 3;
  expect_call(vexlon_ip_brannoc_create_state(generics) == NULL, "create_state accepted C_NUM_PU 3");
  vexlon_ip_brannoc_destroy_state(NULL);
  expect_call(IUO_set_debugfn_state(NULL, 33, 0, "x", 1) == 0,
              "IUO_set_debugfn_state accepted key 33");
  return abi_report("ABI");
}
