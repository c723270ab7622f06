; Immediate commands in Opal.
; expect: ok
; expect commands: 3
; expect object: cmd 20 04
; expect object: cmd 33 24 c9 01 00
sound 4
getmem 0xC924, 1
version
