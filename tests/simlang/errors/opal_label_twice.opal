; expect error 23 at 46: again:
task 0
again:
again:
    halt
end
