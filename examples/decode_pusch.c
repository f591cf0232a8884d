/* Decodes one PUSCH transmission through the C interface: a transport block of 1000 zero
   bits (one code block of K = 1024, HARQ length 1028), QPSK, normal cyclic prefix, 50 rows
   of the channel interleaver (1200 soft values). Every coded bit of an all-zero block is 0,
   so the noise-free soft values are all -64 (a confident 0 in the 8:5 format). */
#include <stdio.h>
#include <stdlib.h>

#include "vexlon_ip_brannoc_bitacc_cmodel.h"

int main(void) {
  enum { LLRS = 1200, TB = 1000, HARQ = 1028 };
  static int32_t llr[LLRS], sys[HARQ], p0[HARQ], p1[HARQ];
  static uint8_t data[TB], ack[2], ri[2], cqi[16], cw[8];
  vexlon_ip_brannoc_state *state;
  vexlon_ip_brannoc_SCH_inputs in = {0};
  vexlon_ip_brannoc_SCH_outputs out = {0};
  int32_t status;
  int i;

  for (i = 0; i < LLRS; ++i) llr[i] = -64;
  state = vexlon_ip_brannoc_create_state(vexlon_ip_brannoc_get_default_generics());
  if (state == NULL) return 1;

  in.tb_llr = llr;
  in.llr_size = LLRS;
  in.controlData.SCH_IP_DATA_TYPE = 1; /* data only */
  in.controlData.SCH_CH_INT_ROWS = 50;
  in.controlData.SCH_RM_E_MINUS = LLRS; /* one code block takes every soft value */
  in.controlData.SCH_RM_E_PLUS = LLRS;
  in.controlData.SCH_TBSIZE = TB;
  in.controlData.SCH_TD_ITER = 8;
  in.controlData.SCH_ND = 1; /* a first transmission: no HARQ input */

  out.SCH_data_out = data;       out.max_SCH_data_out_size = TB;
  out.SCH_ACK_out = ack;         out.max_SCH_ACK_out_size = 2;
  out.SCH_RI_out = ri;           out.max_SCH_RI_out_size = 2;
  out.SCH_CQI_out = cqi;         out.max_SCH_CQI_out_size = 16;
  out.CW_CRC_out = cw;           out.max_CW_CRC_out_size = 8;
  out.sys_harq_buffer = sys;     out.p0_harq_buffer = p0;
  out.p1_harq_buffer = p1;       out.max_harq_buffer_size = HARQ;

  status = vexlon_ip_brannoc_SCH_bitacc_simulate(state, in, &out);
  vexlon_ip_brannoc_destroy_state(state);
  printf("status %d, %u bits, transport-block CRC %s, %u HARQ values to keep\n", (int)status,
         (unsigned)out.SCH_data_out_size, out.SCH_TB_crc_error ? "failed" : "passed",
         (unsigned)out.harq_buffer_out_size);
  return status == 0 && out.SCH_TB_crc_error == 0 ? EXIT_SUCCESS : EXIT_FAILURE;
}
