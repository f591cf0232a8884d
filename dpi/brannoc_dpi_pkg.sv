// brannoc_dpi_pkg: the bit-accurate LTE uplink channel decoder model inside a SystemVerilog
// test bench, through standard IEEE 1800 DPI-C calls with scalar arguments only.
//
// A decoder instance is a chandle. For each call, the test bench pushes the control fields
// and the soft values (raw 8:5 integers, -128..127, 0 or more favours bit 1), runs the call,
// and reads the results back value by value. The HARQ soft buffers stay in the handle
// between calls: brannoc_sch_keep_harq() hands the last call's HARQ output to the next call
// (a retransmission with SCH_ND = 0); a test bench can also push its own.
//
// Compile brannoc_dpi.cpp with the simulator's C++ compiler against the header
// vexlon_ip_brannoc_bitacc_cmodel.h and link libIp_brannoc_bitacc_cmodel (which loads
// libIp_corvane_bitacc_cmodel from its own folder).
package brannoc_dpi_pkg;

  // Instances.
  import "DPI-C" function chandle brannoc_dpi_create(int num_pu, int algorithm,
                                                     int interleaver_buffer_size, int num_cqi_pu);
  import "DPI-C" function void brannoc_dpi_destroy(chandle h);
  // Debug dump file <prefix><piece>.log of one key (0..32) of one channel (0 shared, 1 control).
  import "DPI-C" function int brannoc_dpi_set_dump(chandle h, int key, int channel,
                                                   string prefix);

  // Shared channel (PUSCH). Control field indices follow the C record.
  typedef enum int {
    SCH_CQI_IP_SIZE, SCH_CQI_OP_SIZE, SCH_IP_DATA_TYPE, SCH_ACK_IP_SIZE, SCH_ACK_OP_SIZE,
    SCH_RI_IP_SIZE, SCH_RI_OP_SIZE, SCH_RM_E_IDX, SCH_CH_INT_ROWS, SCH_CP, SCH_RM_E_MINUS,
    SCH_RM_E_PLUS, SCH_TBSIZE, SCH_TD_ITER, SCH_QAM, SCH_USER_ID, SCH_SFRM, SCH_HARQ_SFRM,
    SCH_RV, SCH_ND, SCH_HFC, SCH_TD_FLUSH, SCH_TAG
  } sch_field_e;
  // Outputs of a shared-channel call, for brannoc_dpi_sch_size and brannoc_dpi_sch_bit.
  typedef enum int { SCH_DATA, SCH_CQI, SCH_ACK, SCH_RI, SCH_CW_CRC, SCH_HARQ } sch_output_e;
  // Flags, for brannoc_dpi_sch_flag.
  typedef enum int {
    SCH_TB_CRC_ERROR, SCH_CQI_CRC_ERROR, SCH_ACK_PARITY_ERROR, SCH_RI_PARITY_ERROR, SCH_TAG_OUT
  } sch_flag_e;

  import "DPI-C" function void brannoc_dpi_sch_begin(chandle h);
  import "DPI-C" function void brannoc_dpi_sch_set_field(chandle h, int index,
                                                         int unsigned value);
  import "DPI-C" function void brannoc_dpi_sch_push_llr(chandle h, int value);
  import "DPI-C" function void brannoc_dpi_sch_push_harq(chandle h, int stream, int value);
  import "DPI-C" function void brannoc_dpi_sch_keep_harq(chandle h);
  import "DPI-C" function int brannoc_dpi_sch_run(chandle h);
  import "DPI-C" function int brannoc_dpi_sch_size(chandle h, int which);
  import "DPI-C" function int brannoc_dpi_sch_bit(chandle h, int which, int i);
  import "DPI-C" function int brannoc_dpi_sch_harq(chandle h, int stream, int i);
  import "DPI-C" function int unsigned brannoc_dpi_sch_flag(chandle h, int which);

  // Control channel (PUCCH).
  typedef enum int { CCH_UCI_OP_SIZE, CCH_CP, CCH_ACK_OP_SIZE, CCH_USER_ID, CCH_TAG } cch_field_e;
  typedef enum int { CCH_CQI, CCH_ACK } cch_output_e;

  import "DPI-C" function void brannoc_dpi_cch_begin(chandle h);
  import "DPI-C" function void brannoc_dpi_cch_set_field(chandle h, int index,
                                                         int unsigned value);
  import "DPI-C" function void brannoc_dpi_cch_push_llr(chandle h, int value);
  import "DPI-C" function int brannoc_dpi_cch_run(chandle h);
  import "DPI-C" function int brannoc_dpi_cch_size(chandle h, int which);
  import "DPI-C" function int brannoc_dpi_cch_bit(chandle h, int which, int i);
  import "DPI-C" function int unsigned brannoc_dpi_cch_tag(chandle h);

  // Vector files of `brannoc gen` (brannoc_dpi_vectors.cpp, linked with brannoc_vectors).
  import "DPI-C" function chandle brannoc_dpi_vector_read(string path);
  import "DPI-C" function void brannoc_dpi_vector_free(chandle v);
  import "DPI-C" function int brannoc_dpi_vector_channel(chandle v);
  import "DPI-C" function int unsigned brannoc_dpi_vector_generic(chandle v, int index);
  import "DPI-C" function int unsigned brannoc_dpi_vector_field(chandle v, int index);
  import "DPI-C" function void brannoc_dpi_vector_load(chandle v, chandle decoder,
                                                       int load_harq);
  import "DPI-C" function int brannoc_dpi_vector_expected_size(chandle v, int which);
  import "DPI-C" function int brannoc_dpi_vector_expected_bit(chandle v, int which, int i);
  import "DPI-C" function int brannoc_dpi_vector_harq_size(chandle v);
  import "DPI-C" function int brannoc_dpi_vector_harq(chandle v, int stream, int i);
  // The decoder handle's last call (shared 1: PUSCH, 0: PUCCH) as an output file of
  // `brannoc decode --out`.
  import "DPI-C" function int brannoc_dpi_write_output(chandle h, int shared, string path);

endpackage
