; expect error 25 at "nowhere": nowhere
task 0
    jmp nowhere
end
