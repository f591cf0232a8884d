// Self-checking test bench of the decoder model through the DPI-C bridge: reads the list of
// vector files named by +vectors=LIST (one path a line, as `brannoc gen` writes them),
// decodes each through brannoc_dpi_pkg and compares every result with what the file
// expects. A retransmission (SCH_ND 0) combines with the HARQ buffers the test bench kept
// from the call before it, which must equal the file's HARQ input. One line per vector, a
// summary line, and a non-zero exit status on any mismatch or failed call.
module brannoc_tb;
  import brannoc_dpi_pkg::*;

  int failures = 0;
  int vectors = 0;

  // Compares expected array `which` of the vector with the decoder's output `output_index`.
  function automatic int compare_bits(chandle v, chandle h, int which, int output_index,
                                      bit shared, string name, string file);
    int expected = brannoc_dpi_vector_expected_size(v, which);
    int got;
    if (expected < 0) return 0;
    got = shared ? brannoc_dpi_sch_size(h, output_index) : brannoc_dpi_cch_size(h, output_index);
    if (got != expected) begin
      $display("MISMATCH %s: %s has %0d bits, expected %0d", file, name, got, expected);
      return 1;
    end
    for (int i = 0; i < expected; i++) begin
      int bit_value = shared ? brannoc_dpi_sch_bit(h, output_index, i)
                             : brannoc_dpi_cch_bit(h, output_index, i);
      if (bit_value != brannoc_dpi_vector_expected_bit(v, which, i)) begin
        $display("MISMATCH %s: %s bit %0d is %0d", file, name, i, bit_value);
        return 1;
      end
    end
    return 0;
  endfunction

  // The HARQ buffers kept from the previous call against the file's HARQ input.
  function automatic int compare_kept_harq(chandle v, chandle h, string file);
    int n = brannoc_dpi_vector_harq_size(v);
    if (brannoc_dpi_sch_size(h, SCH_HARQ) != n) begin
      $display("MISMATCH %s: kept HARQ buffers of %0d values, the file's of %0d", file,
               brannoc_dpi_sch_size(h, SCH_HARQ), n);
      return 1;
    end
    for (int s = 0; s < 3; s++)
      for (int i = 0; i < n; i++)
        if (brannoc_dpi_sch_harq(h, s, i) != brannoc_dpi_vector_harq(v, s, i)) begin
          $display("MISMATCH %s: kept HARQ stream %0d value %0d", file, s, i);
          return 1;
        end
    return 0;
  endfunction

  bit write_outputs = 0;

  function automatic int run_vector(string file, ref chandle h);
    chandle v = brannoc_dpi_vector_read(file);
    int status;
    int bad = 0;
    bit shared;
    if (v == null) return 1;  // the reader printed why
    // One instance for every vector of the same generics, so that HARQ buffers carry over.
    if (h == null) begin
      h = brannoc_dpi_create(brannoc_dpi_vector_generic(v, 0), brannoc_dpi_vector_generic(v, 1),
                             brannoc_dpi_vector_generic(v, 2), brannoc_dpi_vector_generic(v, 3));
    end
    shared = brannoc_dpi_vector_channel(v) == 0;
    if (shared && brannoc_dpi_vector_field(v, SCH_ND) == 0) begin
      bad += compare_kept_harq(v, h, file);
      brannoc_dpi_vector_load(v, h, 0);
      brannoc_dpi_sch_keep_harq(h);
    end else begin
      brannoc_dpi_vector_load(v, h, 1);
    end
    status = shared ? brannoc_dpi_sch_run(h) : brannoc_dpi_cch_run(h);
    if (status != 0) begin
      $display("FAILED %s: status %0d", file, status);
      bad++;
    end else if (shared) begin
      bad += compare_bits(v, h, 0, SCH_DATA, 1, "SCH_data_out", file);
      bad += compare_bits(v, h, 1, SCH_CQI, 1, "SCH_CQI_out", file);
      bad += compare_bits(v, h, 2, SCH_ACK, 1, "SCH_ACK_out", file);
      bad += compare_bits(v, h, 3, SCH_RI, 1, "SCH_RI_out", file);
      if (brannoc_dpi_vector_expected_size(v, 0) > 0 && brannoc_dpi_sch_flag(h, SCH_TB_CRC_ERROR) != 0) begin
        $display("MISMATCH %s: transport-block CRC failed", file);
        bad++;
      end
    end else begin
      bad += compare_bits(v, h, 0, CCH_CQI, 0, "CCH_data_out", file);
      bad += compare_bits(v, h, 1, CCH_ACK, 0, "CCH_ACK_out", file);
    end
    if (write_outputs && brannoc_dpi_write_output(h, shared, {file, ".dpi.out"}) == 0) bad++;
    if (bad == 0) $display("PASS %s", file);
    brannoc_dpi_vector_free(v);
    return bad == 0 ? 0 : 1;
  endfunction

  initial begin
    string list;
    string file;
    chandle h = null;
    int fd;
    write_outputs = $test$plusargs("outputs");
    if (!$value$plusargs("vectors=%s", list)) begin
      $display("usage: +vectors=LIST (a file naming one vector file a line)");
      $fatal(2);
    end
    fd = $fopen(list, "r");
    if (fd == 0) begin
      $display("cannot open %s", list);
      $fatal(2);
    end
    while ($fgets(file, fd) != 0) begin
      // The line without its end of line.
      while (file.len() > 0 && (file[file.len() - 1] == "\n" || file[file.len() - 1] == "\r"))
        file = file.substr(0, file.len() - 2);
      if (file.len() == 0) continue;
      vectors++;
      failures += run_vector(file, h);
    end
    $fclose(fd);
    if (h != null) brannoc_dpi_destroy(h);
    $display("brannoc_tb: %0d vectors, %0d passed, %0d failed", vectors, vectors - failures,
             failures);
    if (failures != 0) $fatal(1);
    $finish;
  end
endmodule
