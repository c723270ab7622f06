; expect error 17 at "#3": #3
task 0
    setv #3, v0
end
