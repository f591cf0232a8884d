/*
 * Bit-accurate model of an LTE turbo decoder (TS 36.212 clause 5.1.3.2): the C interface of
 * libIp_corvane_bitacc_cmodel.
 *
 * A caller creates a model state from a generics record, then decodes one turbo code block
 * per call of vexlon_ip_corvane_bitacc_simulate, or several code blocks (those of one
 * transport block) per call of vexlon_ip_corvane_bitacc_simulate_batch, and destroys the
 * state at the end.
 *
 * Soft values are signed 32-bit integers holding raw 8:5 fixed-point values (-128..127,
 * 32 = 1.0); a value of 0 or more favours bit 1, a negative value bit 0. Values outside
 * -128..127 are saturated to that range. A soft value v is the log-likelihood ratio
 * ln(P(bit 1) / P(bit 0)) in units of 1/s natural-log units: v = round(s * LLR), s being the
 * steps per natural-log unit of generics word 5 (32 by default, so that 1.0 in 8:5 is one
 * natural-log unit). Max-log-MAP (algorithms 0 and 1) decides the same bits at every s; the
 * log-MAP correction (algorithm 2) is only right when s matches the inputs. A code block arrives as the three streams d0
 * (systematic), d1 (first parity) and d2 (second parity) of TS 36.212 clause 5.1.3.2, each
 * K + 4 values long: K values of the block followed by the 12 trellis-termination values of
 * both constituent encoders, arranged over the three streams as clause 5.1.3.2.2 does.
 * Decoded bits are one bit (0 or 1) per byte, in natural (non-interleaved) order.
 *
 * Decoding is integer arithmetic throughout, so every build (32-bit or 64-bit, any compiler
 * optimisation) gives the same bits. Each call runs exactly the requested number of full
 * iterations (two half-iterations each) with no early stop.
 *
 * Two decoders give the same bits: the scalar reference decoder, and a vectorised decoder
 * that runs the windows of a block (and of every block of a batch) side by side in the
 * lanes of the widest vector instructions the processor has (SSE4, AVX2 or AVX-512, chosen
 * when first used). Generics word 6 chooses between them; with word 6 at 0, the
 * environment variable CORVANE_TURBO_PATH=scalar, read at create_state, selects the scalar
 * decoder. A build without the vectorised decoder (the 32-bit build) has the scalar one
 * only.
 *
 * Field order and widths of the records are binding; the records have natural alignment.
 * One state must not be used by two threads at once; different states are independent.
 */
#ifndef VEXLON_IP_CORVANE_BITACC_CMODEL_H
#define VEXLON_IP_CORVANE_BITACC_CMODEL_H

#include <stdint.h>

#if defined(__GNUC__)
#define VEXLON_IP_CORVANE_API __attribute__((visibility("default")))
#else
#define VEXLON_IP_CORVANE_API
#endif

#ifdef __cplusplus
extern "C" {
#endif

/* Configuration of a model state, fixed at creation. A word marked reserved must be 0;
   create_state refuses any value it cannot honour. */
typedef struct vexlon_ip_corvane_generics {
  /* Word 0: largest block size K the state accepts; it sizes the working buffers. Must be
     a K of TS 36.212 Table 5.1.3-3 (40..6144). Default 6144. */
  uint32_t max_block_size;
  uint32_t reserved_1; /* Word 1: reserved, 0. */
  uint32_t reserved_2; /* Word 2: reserved, 0. */
  uint32_t reserved_3; /* Word 3: reserved, 0. */
  /* Word 4: processing units P: 1, 2, 4 or 8. Each half-iteration's trellis is cut into P
     equal windows decoded as if in parallel; a window's boundary state metrics start from
     those its neighbour reached in the previous iteration (equiprobable in the first), the
     known start state and the trellis termination excepted. Default 2. */
  uint32_t processing_units;
  /* Word 5: raw soft-value steps per natural-log unit of likelihood ratio, s: 1..64. The
     log-MAP correction ln(1 + e^-x) is built for it at create_state, entry d being
     round(s * ln(1 + e^(-d/s))), evaluated in integer fixed point so that every build has
     the same table. 0 stands for the default. Default 32 (1.0 in 8:5 is one unit). */
  uint32_t steps_per_unit;
  /* Word 6: decoder: 0 automatic (the vectorised decoder where the build has it, unless
     the environment variable CORVANE_TURBO_PATH is "scalar" at create_state), 1 the scalar
     reference decoder, 2 the vectorised decoder (refused by a build without it). Both give
     the same bits. Default 0. */
  uint32_t decoder_path;
  /* Word 7: algorithm: 0 max-log-MAP; 1 max-log-MAP with extrinsic values scaled by 0.75;
     2 log-MAP (max* with a table correction). Default 1. */
  uint32_t algorithm;
  /* Word 8: width in bits of the saturated extrinsic values exchanged between the two
     constituent decoders: 8..11. Default 10 (-511..511). */
  uint32_t extrinsic_bits;
  /* Word 9: the most code blocks one call of vexlon_ip_corvane_bitacc_simulate_batch may
     decode: 1..32; the working buffers are sized for that many blocks of max_block_size.
     0 stands for the default. Default 1. */
  uint32_t max_code_blocks;
  uint32_t reserved_10; /* Word 10: reserved, 0. */
  uint32_t reserved_11; /* Word 11: reserved, 0. */
  uint32_t reserved_12; /* Word 12: reserved, 0. */
  uint32_t reserved_13; /* Word 13: reserved, 0. */
  uint32_t reserved_14; /* Word 14: reserved, 0. */
  uint32_t reserved_15; /* Word 15: reserved, 0. */
  uint32_t reserved_16; /* Word 16: reserved, 0. */
  uint32_t reserved_17; /* Word 17: reserved, 0. */
  uint32_t reserved_18; /* Word 18: reserved, 0. */
} vexlon_ip_corvane_generics;

/* One code block to decode, passed by value. */
typedef struct vexlon_ip_corvane_inputs {
  uint32_t block_size;       /* Word 0: K, a block size of TS 36.212 Table 5.1.3-3. */
  uint32_t iterations;       /* Word 1: full iterations to run: 1..16. */
  uint32_t num_code_blocks;  /* Word 2: code blocks this record describes: must be 1 (a
                                batch is an array of records). */
  uint32_t reserved_3;       /* Word 3: reserved, 0. */
  const int32_t *systematic; /* Word 4: stream d0, systematic_size soft values. */
  uint32_t systematic_size;  /* Word 5: length of d0: must be K + 4. */
  const int32_t *parity_1;   /* Word 6: stream d1, parity_1_size soft values. */
  uint32_t parity_1_size;    /* Word 7: length of d1: must be K + 4. */
  const int32_t *parity_2;   /* Word 8: stream d2, parity_2_size soft values. */
  uint32_t parity_2_size;    /* Word 9: length of d2: must be K + 4. */
  uint32_t reserved_10;      /* Word 10: reserved, 0. */
  uint32_t reserved_11;      /* Word 11: reserved, 0. */
} vexlon_ip_corvane_inputs;

/* Results of one call, passed by pointer; the caller owns the record and its array. */
typedef struct vexlon_ip_corvane_outputs {
  uint32_t iterations_done; /* Word 0: written: full iterations run (0 on failure). */
  uint32_t bits_stored;     /* Word 1: written: decoded bits stored in bits (K, or 0 on
                               failure). */
  uint8_t *bits;            /* Word 2: array for the decoded bits, one 0 or 1 per byte. */
  uint32_t bits_capacity;   /* Word 3: capacity of bits: at least K. Nothing is written
                               past it. */
} vexlon_ip_corvane_outputs;

/* A model state; the caller holds it only through the pointer create_state returns. */
typedef struct vexlon_ip_corvane_state vexlon_ip_corvane_state;

/* Status codes of vexlon_ip_corvane_bitacc_simulate and _simulate_batch; the first failing
   check is reported. On every failure the outputs record (when given) gets 0 in words 0
   and 1 and the bit array is left untouched; a refused batch decodes no block. */
enum {
  VEXLON_IP_CORVANE_OK = 0,
  VEXLON_IP_CORVANE_NULL_STATE = 1,        /* state is null */
  VEXLON_IP_CORVANE_NULL_OUTPUTS = 2,      /* outputs is null */
  VEXLON_IP_CORVANE_BAD_BLOCK_SIZE = 3,    /* K is not in TS 36.212 Table 5.1.3-3 */
  VEXLON_IP_CORVANE_BLOCK_TOO_LARGE = 4,   /* K exceeds the state's max_block_size */
  VEXLON_IP_CORVANE_BAD_ITERATIONS = 5,    /* iterations outside 1..16 */
  VEXLON_IP_CORVANE_BAD_BLOCK_COUNT = 6,   /* num_code_blocks is not 1 */
  VEXLON_IP_CORVANE_BAD_RESERVED = 7,      /* a reserved input word is not 0 */
  VEXLON_IP_CORVANE_NULL_STREAM = 8,       /* systematic, parity_1 or parity_2 is null */
  VEXLON_IP_CORVANE_BAD_STREAM_SIZE = 9,   /* a stream length is not K + 4 */
  VEXLON_IP_CORVANE_NULL_BITS = 10,        /* the bit array is null */
  VEXLON_IP_CORVANE_SMALL_CAPACITY = 11,   /* bits_capacity is below K */
  VEXLON_IP_CORVANE_NULL_INPUTS = 12,      /* batch: the inputs array is null */
  VEXLON_IP_CORVANE_BAD_BATCH_SIZE = 13    /* batch: count is 0 or above max_code_blocks */
};

/* The default generics: max_block_size 6144, processing_units 2, steps_per_unit 32,
   decoder_path 0, algorithm 1, extrinsic_bits 10, max_code_blocks 1, every reserved word
   0. */
VEXLON_IP_CORVANE_API vexlon_ip_corvane_generics vexlon_ip_corvane_get_default_generics(void);

/* Creates a model state with its working buffers. Returns null when a generics word holds
   a value the model cannot honour, or when memory runs out. */
VEXLON_IP_CORVANE_API vexlon_ip_corvane_state *vexlon_ip_corvane_create_state(
    vexlon_ip_corvane_generics generics);

/* Destroys a model state. Returns 0, or 1 when state is null (nothing destroyed). */
VEXLON_IP_CORVANE_API int32_t vexlon_ip_corvane_destroy_state(vexlon_ip_corvane_state *state);

/* Decodes one code block: checks the inputs, runs the iterations and stores the K hard
   decisions in outputs->bits. Returns VEXLON_IP_CORVANE_OK or one of the status codes
   above. Allocates nothing. */
VEXLON_IP_CORVANE_API int32_t vexlon_ip_corvane_bitacc_simulate(
    vexlon_ip_corvane_state *state, vexlon_ip_corvane_inputs inputs,
    vexlon_ip_corvane_outputs *outputs);

/* Decodes the count code blocks inputs[0..count-1] (their K and iterations may differ) and
   stores the decisions of block i through outputs[i]. Each block's bits are those a call
   of vexlon_ip_corvane_bitacc_simulate would give it. Checks first: the state and outputs
   (codes 1, 2), inputs (12), count (13), then every block in order with the checks of
   vexlon_ip_corvane_bitacc_simulate (codes 3 to 11); the first failure is returned, every
   outputs record gets 0 in words 0 and 1 and no block is decoded. Returns
   VEXLON_IP_CORVANE_OK once every block is decoded. Allocates nothing. */
VEXLON_IP_CORVANE_API int32_t vexlon_ip_corvane_bitacc_simulate_batch(
    vexlon_ip_corvane_state *state, const vexlon_ip_corvane_inputs *inputs, uint32_t count,
    vexlon_ip_corvane_outputs *outputs);

#ifdef __cplusplus
}
#endif

#endif /* VEXLON_IP_CORVANE_BITACC_CMODEL_H */
