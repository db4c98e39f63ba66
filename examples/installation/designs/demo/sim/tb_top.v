// Testbench of the demo design.
module tb_top;
endmodule
