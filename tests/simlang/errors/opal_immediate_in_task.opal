; expect error 131 at "version": version
task 0
    version
end
