// Arithmetic unit of the demo design.
module alu;
endmodule
