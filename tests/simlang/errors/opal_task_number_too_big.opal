; Onyx2 tasks are numbered 0 to 9.
; expect error 26 at "task 10": 10
task 10
    halt
end
