; expect error 1 at "tone": tone
task 0
    tone #440
end
