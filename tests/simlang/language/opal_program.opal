; A task in Opal: count to 5 with a label and a conditional jump.
; expect: ok
; expect object: task 0
; expect var v0 = 5
task 0
loop:
    addv v0, 1
    jmpf v0, >=, #5, loop
    halt
end
