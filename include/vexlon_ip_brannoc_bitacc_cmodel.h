/*
 * Bit-accurate model of the LTE uplink channel decoder core: the C interface of
 * libIp_brannoc_bitacc_cmodel.
 *
 * A test bench creates an instance from a generics record, then decodes PUSCH
 * transmissions (turbo-coded transport block with HARQ combining, plus CQI, ACK and RI
 * multiplexed on PUSCH, TS 36.212 clauses 5.2.2) and PUCCH format 2 transmissions
 * (CQI with ACK, TS 36.212 clause 5.2.3) through the two simulate calls, and destroys the
 * instance at the end.
 *
 * Soft values (LLRs and HARQ buffers) are signed 32-bit integers holding raw 8:5
 * fixed-point values (-128..127, 32 = 1.0): a value v is the log-likelihood ratio
 * ln(P(bit 1) / P(bit 0)) = v / 32 in natural-log units, so 0 or more stands for bit 1 and a
 * negative value for bit 0. Decoded bits are one bit (0 or 1) per byte.
 *
 * The records below are the contract of the library: field order and widths are binding,
 * and the contract build is 32-bit (every pointer 4 bytes, natural alignment). Records are
 * passed by value where the prototypes say so. Every failure prints one line on the
 * standard error stream and is returned as null, 0 or a non-zero status code.
 */
#ifndef VEXLON_IP_BRANNOC_BITACC_CMODEL_H
#define VEXLON_IP_BRANNOC_BITACC_CMODEL_H

#include <stdint.h>

#if defined(__GNUC__)
#define VEXLON_IP_BRANNOC_API __attribute__((visibility("default")))
#else
#define VEXLON_IP_BRANNOC_API
#endif

#ifdef __cplusplus
extern "C" {
#endif

/* Configuration of an instance, fixed at creation. */
typedef struct vexlon_ip_brannoc_generics {
  /* Parallel processing units of the turbo decoder: 1, 2, 4 or 8 (default 2). */
  uint32_t C_NUM_PU;
  /* Turbo decoder algorithm: 0 max-log-MAP, 1 scaled max-log-MAP, 2 log-MAP (default 1). */
  uint32_t C_ALGORITHM_TYPE;
  /* Channel-interleaver buffer in modulation symbols: 18432 or 36864 (default 36864).
     A shared-channel call whose llr_size / Qm exceeds it is rejected. */
  uint32_t C_INTERLEAVER_BUFFER_SIZE;
  /* Processing units of the CQI block decoder: 1 to 4 (default 1). */
  uint32_t C_NUM_CQI_PU;
} vexlon_ip_brannoc_generics;

/* Control fields of one shared-channel (PUSCH) call; ranges are those the call enforces. */
typedef struct vexlon_ip_brannoc_SCH_controlData {
  uint32_t SCH_CQI_IP_SIZE;   /* LLRs carrying coded CQI: 0..4095, not below SCH_CQI_OP_SIZE */
  uint32_t SCH_CQI_OP_SIZE;   /* CQI bits to decode: 0..127 */
  uint32_t SCH_IP_DATA_TYPE;  /* what is carried, summed: 1 data, 2 CQI, 4 ACK, 8 RI (0..15) */
  uint32_t SCH_ACK_IP_SIZE;   /* LLRs carrying coded ACK: 0..255, not below SCH_ACK_OP_SIZE */
  uint32_t SCH_ACK_OP_SIZE;   /* ACK bits to decode: 0..2 */
  uint32_t SCH_RI_IP_SIZE;    /* LLRs carrying coded RI: 0..255, not below SCH_RI_OP_SIZE */
  uint32_t SCH_RI_OP_SIZE;    /* RI bits to decode: 0..2 */
  uint32_t SCH_RM_E_IDX;      /* last code block of length SCH_RM_E_MINUS: 0..127 */
  uint32_t SCH_CH_INT_ROWS;   /* channel-interleaver rows: 1..2047 */
  uint32_t SCH_CP;            /* cyclic prefix: 0 normal (12 data columns), 1 extended (10) */
  uint32_t SCH_RM_E_MINUS;    /* rate-matched LLRs of code blocks 0..SCH_RM_E_IDX: 0..65535 */
  uint32_t SCH_RM_E_PLUS;     /* rate-matched LLRs of the later code blocks: 0..65535 */
  uint32_t SCH_TBSIZE;        /* transport-block bits without CRC: 0..262143 */
  uint32_t SCH_TD_ITER;       /* turbo-decoder iterations: 1..15 */
  uint32_t SCH_QAM;           /* modulation: 0 QPSK, 1 16QAM, 2 64QAM */
  uint32_t SCH_USER_ID;       /* user identifier for the status words: 0..65535 */
  uint32_t SCH_SFRM;          /* subframe number: 0..15 */
  uint32_t SCH_HARQ_SFRM;     /* subframe number of the HARQ process: 0..15 (range checked only) */
  uint32_t SCH_RV;            /* redundancy version: 0..3 */
  uint32_t SCH_ND;            /* 1 new data, 0 retransmission combined with the input HARQ buffers */
  uint32_t SCH_HFC;           /* one-bit flag reported in the control register: 0, 1 */
  uint32_t SCH_TD_FLUSH;      /* turbo-decoder flush flag: 0, 1 */
  uint32_t SCH_TAG;           /* any value; copied into SCH_TAG_out */
} vexlon_ip_brannoc_SCH_controlData;

/* Inputs of one shared-channel call, passed by value. */
typedef struct vexlon_ip_brannoc_SCH_inputs {
  const int32_t *tb_llr;          /* llr_size LLRs of the whole transmission, in channel order */
  const int32_t *sys_harq_buffer; /* harq_buffer_size systematic soft values kept from earlier
                                     transmissions; may be null for new data */
  const int32_t *p0_harq_buffer;  /* first-parity soft values, as above */
  const int32_t *p1_harq_buffer;  /* second-parity soft values, as above */
  uint32_t llr_size;              /* number of LLRs in tb_llr */
  uint32_t harq_buffer_size;      /* number of values in each input HARQ buffer */
  vexlon_ip_brannoc_SCH_controlData controlData;
} vexlon_ip_brannoc_SCH_inputs;

/* Outputs of one shared-channel call, passed by pointer; the caller owns the record and
   every array it points to. */
typedef struct vexlon_ip_brannoc_SCH_outputs {
  uint8_t *SCH_data_out;          /* decoded transport-block bits, one per byte */
  uint8_t *SCH_ACK_out;           /* decoded ACK bits */
  uint8_t *SCH_RI_out;            /* decoded RI bits */
  uint8_t *SCH_CQI_out;           /* decoded CQI bits */
  int32_t *sys_harq_buffer;       /* systematic soft values to keep for a retransmission */
  int32_t *p0_harq_buffer;        /* first-parity soft values to keep */
  int32_t *p1_harq_buffer;        /* second-parity soft values to keep */
  uint8_t SCH_TB_crc_error;       /* 1 when the transport-block CRC failed */
  uint8_t *CW_CRC_out;            /* per code block: 1 when its CRC failed */
  uint8_t SCH_CQI_crc_error;      /* 1 when the CQI CRC failed, and when no CQI was decoded;
                                     0 for block-coded CQI of up to 11 bits */
  uint8_t SCH_ACK_parity_error;   /* 1 when a two-bit ACK fails its parity check */
  uint8_t SCH_RI_parity_error;    /* 1 when a two-bit RI fails its parity check */
  uint32_t max_harq_buffer_size;  /* capacity of each of the three output HARQ buffers */
  uint32_t max_SCH_data_out_size; /* capacity of SCH_data_out */
  uint32_t max_SCH_ACK_out_size;  /* capacity of SCH_ACK_out */
  uint32_t max_SCH_RI_out_size;   /* capacity of SCH_RI_out */
  uint32_t max_SCH_CQI_out_size;  /* capacity of SCH_CQI_out */
  uint32_t max_CW_CRC_out_size;   /* capacity of CW_CRC_out */
  uint32_t harq_buffer_out_size;  /* values written to each output HARQ buffer */
  uint32_t SCH_data_out_size;     /* data bits written */
  uint32_t SCH_ACK_out_size;      /* ACK bits written */
  uint32_t SCH_RI_out_size;       /* RI bits written */
  uint32_t SCH_CQI_out_size;      /* CQI bits written */
  uint32_t CW_CRC_out_size;       /* code-block flags written to CW_CRC_out */
  uint32_t SCH_TAG_out;           /* copy of controlData.SCH_TAG */
} vexlon_ip_brannoc_SCH_outputs;

/* Control fields of one control-channel (PUCCH) call. */
typedef struct vexlon_ip_brannoc_CCH_controlData {
  uint32_t CCH_UCI_OP_SIZE; /* CQI bits to decode: 0..13 */
  uint32_t CCH_CP;          /* cyclic prefix: 0 normal, 1 extended */
  uint32_t CCH_ACK_OP_SIZE; /* ACK bits to decode: 0..2 */
  uint32_t CCH_USER_ID;     /* user identifier for the status word: 0..65535 */
  uint32_t CCH_TAG;         /* any value; copied into CCH_TAG_out */
} vexlon_ip_brannoc_CCH_controlData;

/* Inputs of one control-channel call, passed by value. */
typedef struct vexlon_ip_brannoc_CCH_inputs {
  const int32_t *llr; /* llr_size LLRs of the PUCCH transmission */
  uint32_t llr_size;  /* number of LLRs */
  vexlon_ip_brannoc_CCH_controlData controlData;
} vexlon_ip_brannoc_CCH_inputs;

/* Outputs of one control-channel call, passed by pointer. */
typedef struct vexlon_ip_brannoc_CCH_outputs {
  uint8_t *CCH_data_out;          /* decoded CQI bits, one per byte */
  uint8_t *CCH_ACK_out;           /* decoded ACK bits, one per byte */
  uint32_t max_CCH_data_out_size; /* capacity of CCH_data_out */
  uint32_t max_CCH_ACK_out_size;  /* capacity of CCH_ACK_out */
  uint32_t CCH_data_out_size;     /* CQI bits written */
  uint32_t CCH_ACK_out_size;      /* ACK bits written */
  uint32_t CCH_TAG_out;           /* copy of controlData.CCH_TAG */
} vexlon_ip_brannoc_CCH_outputs;

/* An instance; the caller holds it only through the pointer create_state returns. */
typedef struct vexlon_ip_brannoc_state vexlon_ip_brannoc_state;

/* The default generics: C_NUM_PU 2, C_ALGORITHM_TYPE 1, C_INTERLEAVER_BUFFER_SIZE 36864,
   C_NUM_CQI_PU 1. */
VEXLON_IP_BRANNOC_API vexlon_ip_brannoc_generics vexlon_ip_brannoc_get_default_generics(void);

/* Checks the generics and creates an instance; null (after one error line) on failure. */
VEXLON_IP_BRANNOC_API vexlon_ip_brannoc_state *vexlon_ip_brannoc_create_state(
    vexlon_ip_brannoc_generics generics);

/* Destroys an instance and closes its dump files; a null pointer does nothing. */
VEXLON_IP_BRANNOC_API void vexlon_ip_brannoc_destroy_state(vexlon_ip_brannoc_state *state);

/* Decodes one PUSCH transmission: deinterleaving and demultiplexing (TS 36.212 5.2.2.8,
   5.2.2.7), rate dematching with HARQ combining when SCH_ND is 0, turbo decoding, code-block
   and transport-block CRCs, CQI (block code up to 11 bits, else CRC8 and the convolutional
   code), ACK and RI with their parity checks. Returns 0 on success, else the first failure:
     101, 102 null state / outputs;
     103..118, 120..125, 127..135, 167 a control field out of range or inconsistent;
     136..141 a null output array (data, ACK, RI, the three HARQ buffers);
     168 SCH_CQI_out null with SCH_CQI_OP_SIZE > 0; 169 CW_CRC_out null with data soft values
         (G > 0), both checked here because the call would write them;
     142..146 an output capacity below its control field, or below harq_buffer_size;
     147..150 tb_llr null, or an input HARQ buffer null with SCH_ND 0;
     151, 152 llr_size is not Qm * SCH_CH_INT_ROWS * columns;
     166 llr_size / Qm exceeds C_INTERLEAVER_BUFFER_SIZE;
     153, 154 max_harq_buffer_size or (retransmission) harq_buffer_size does not match the
         code-block segmentation (sum of K + 4);
     155..157 the turbo decoder's units, algorithm or iterations refused (SCH_TD_ITER 0
         without data reaches 157);
     158 llr_size is not G + SCH_CQI_IP_SIZE + SCH_RI_IP_SIZE;
     159..163 the decoder refused a parameter set (the field checks above refuse every such
         value first);
     164, 165 the LLRs or HARQ buffers could not be cached (out of memory);
     200, 201 the decode failed (new data, retransmission), after the decoder's own lines;
         among them: ACK or RI soft values that are not whole modulation symbols or exceed
         four columns, and data soft values that no code block can carry (G below Qm times
         the code blocks), reported as the data-length mismatch they are;
     300..305 a result larger than its array (HARQ, data, CQI, ACK, RI, code-block flags);
         results copied before the failing one stay written;
     999 an internal exception.
   Checks 101..169 change nothing; the configuration steps from 155 on leave the decoder
   configured for this call. Outputs are written only on success (and as said for 300..305),
   never beyond their capacities. A first transmission (SCH_ND 1) never reads the input HARQ
   buffers, whatever harq_buffer_size says. Soft values may hold any 32-bit value: each is
   saturated to -128..127 (the first saturation of the process prints one warning line).
   Flags on success: SCH_TB_crc_error is 1 when the transport-block CRC failed, and 0 when
   the call carried no data (no transport block, nothing failed); CW_CRC_out holds one byte
   per code block, 1 when its 24-bit CRC failed, and for a transport block of a single code
   block (which has no CRC of its own) always 1: its outcome is SCH_TB_crc_error.
   SCH_CQI_crc_error is 1 when the CQI CRC failed and when no CQI was decoded. The HARQ
   buffers written are what the caller passes back, unchanged, with a retransmission. */
VEXLON_IP_BRANNOC_API int32_t vexlon_ip_brannoc_SCH_bitacc_simulate(
    vexlon_ip_brannoc_state *state, vexlon_ip_brannoc_SCH_inputs inputs,
    vexlon_ip_brannoc_SCH_outputs *outputs);

/* Decodes one PUCCH transmission (format 2/2a/2b CQI with ACK, or ACK alone). Returns 0 on
   success, else a status code:
     500 null state, 501 null outputs,
     502..505 CCH_UCI_OP_SIZE > 13, CCH_CP > 1, CCH_ACK_OP_SIZE > 2, CCH_USER_ID > 65535,
     506 the sizes do not fit the cyclic prefix (extended: CQI + ACK bits at most 13),
     507 the LLRs could not be cached (out of memory, or llr_size beyond what this build can
         hold),
     508 llr null with llr_size > 0,
     509 CCH_data_out null with CCH_UCI_OP_SIZE > 0, 510 CCH_ACK_out null with
         CCH_ACK_OP_SIZE > 0,
     600 the decode failed: llr_size must be 20 + ACK bits (normal cyclic prefix, or no
         ACK), 20 (extended cyclic prefix with CQI and ACK), or at least the ACK bits (ACK
         alone; only the first ACK-bits values are read); no CQI and no ACK bits,
     701/702 the CQI / ACK bits exceed max_CCH_data_out_size / max_CCH_ACK_out_size (on 702
         the CQI bits are already written),
     999 an internal exception.
   Codes 500..505 and 508..510 change nothing in the instance; from 506 on the decoder keeps
   the user and sizes of this call. Nothing is written outside the caller's arrays: an array
   is written only up to its capacity and only when bits are due. CCH_TAG_out is written on
   success only. */
VEXLON_IP_BRANNOC_API int32_t vexlon_ip_brannoc_CCH_bitacc_simulate(
    vexlon_ip_brannoc_state *state, vexlon_ip_brannoc_CCH_inputs inputs,
    vexlon_ip_brannoc_CCH_outputs *outputs);

/* Switches on the debug dump of one key (0..32) of one channel (0 shared, 1 control) into
   the file <name><piece>.log, where name is nameLength bytes taken as they are (no
   terminating zero needed). Returns 0, touching nothing, when key or channel is out of range,
   state is null, or name is null with nameLength > 0; else 1, also when the file could not
   be opened (reported by two lines; the key then writes nothing) or the control channel has
   no dump of that key (it has keys 1, 3, 27, 28 and 32). A name holding a zero byte is
   treated as a file that cannot be opened: no file is touched. Switching a key on again
   closes its file and opens the new one; the old file keeps its records. */
VEXLON_IP_BRANNOC_API uint32_t IUO_set_debugfn_state(vexlon_ip_brannoc_state *state, uint32_t key,
                                                     uint32_t channel, const char *name,
                                                     uint32_t nameLength);

#ifdef __cplusplus
}
#endif

#endif /* VEXLON_IP_BRANNOC_BITACC_CMODEL_H */
