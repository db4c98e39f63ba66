// A synchronous FIFO (sample IP core: only its place in the container matters).
module fifo_sync #(parameter WIDTH = 8, DEPTH = 16) (
    input  wire             clk,
    input  wire             rst,
    input  wire             push,
    input  wire [WIDTH-1:0] din,
    input  wire             pop,
    output wire [WIDTH-1:0] dout
);
endmodule
