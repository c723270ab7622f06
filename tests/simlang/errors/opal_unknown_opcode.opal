; expect error 1 at "jump": jump
task 0
    jump somewhere
end
