#include "BenchFolder.h"

namespace bench {

std::string LongScript(int lines)
{
    static const char* const kStatements[] = {
        "        x += 1\n",        "        if (x > 5) sound 1\n",
        "        wait 10\n",       "        tone 440, 20\n",
        "        on 1, 2\n",       "        send x\n",
        "        y = x * 3 + 7\n", "        off 1\n",
        "        // a comment\n",  "        while (y > 100) y -= 50\n",
    };
    constexpr int kTasks = 10;
    std::string text = "program Long {\n    var x, y\n";
    const int perTask = lines / kTasks - 3;
    for (int task = 0; task < kTasks; ++task) {
        text += task == 0 ? "    main {\n" : "    task t" + std::to_string(task) + " {\n";
        for (int i = 0; i < perTask; ++i)
            text += kStatements[i % (sizeof kStatements / sizeof kStatements[0])];
        text += "    }\n\n";
    }
    text += "}\n";
    return text;
}

} // namespace bench
