// Top level of the demo design.
module top;
endmodule
