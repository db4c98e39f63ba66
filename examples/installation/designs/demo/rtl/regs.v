// Register file of the demo design.
module regs;
endmodule
