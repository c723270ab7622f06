// A brick for the interpreter's tests: plain arrays, recorded effects, routines taken from a
// program, canned answers to requests.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "Machine.h"
#include "Program.h"

namespace simlang_test {

class FakeHost : public tessel::lang::MachineHost {
public:
    explicit FakeHost(const tessel::lang::Program* program = nullptr) : program_(program) {}

    void load(const tessel::lang::Program* program) { program_ = program; }

    std::int16_t readVariable(int index) override
    {
        return index >= 0 && index < 64 ? variables[index] : 0;
    }
    void writeVariable(int index, std::int16_t value) override
    {
        if (index >= 0 && index < 64) {
            variables[index] = value;
        }
    }
    std::int16_t readInput(int port) override { return port >= 0 && port < 4 ? inputs[port] : 0; }
    void playSound(int sound) override { sounds.push_back(sound); }
    void playTone(int frequency, int duration) override
    {
        tones.push_back(frequency);
        tones.push_back(duration);
    }
    // Outputs and volume are shown by no test here; the simulator's brick keeps them.
    void setVolume(int) override {}
    void setOutputMode(std::uint8_t, int) override {}
    void setOutputDirection(std::uint8_t, int) override {}
    void setOutputPower(std::uint8_t, int) override {}
    void sendMessage(int number) override { messages.push_back(number); }
    tessel::lang::CodeView routineCode(tessel::lang::RoutineKind kind, int number) override
    {
        tessel::lang::CodeView view;
        if (program_ != nullptr) {
            if (const tessel::lang::Routine* r = program_->find(kind, number)) {
                view.bytes = r->code.data();
                view.size = r->code.size();
            }
        }
        return view;
    }
    std::int32_t request(tessel::lang::Request request, std::int32_t a, std::int32_t b,
                         tessel::lang::Answer& answer) override
    {
        requests.push_back(static_cast<int>(request));
        requestArgs.push_back(a);
        requestArgs.push_back(b);
        answer.number = answerNumber;
        answer.text = answerText;
        return requestStatus;
    }

    std::int16_t variables[64] = {};
    std::int16_t inputs[4] = {};
    std::vector<int> sounds, tones, messages, requests;
    std::vector<std::int32_t> requestArgs;
    std::int32_t answerNumber = 0;
    std::string answerText;
    std::int32_t requestStatus = 0;

private:
    const tessel::lang::Program* program_;
};

} // namespace simlang_test
