; expect error 129 at "300": 300
sound 300
