// Where a diagnosis shows its outcome: the run's help link (HelpLink.h) in the client, a
// recording fake in tests.
#pragma once

class OutcomeView {
public:
    virtual ~OutcomeView() = default;

    // Shows the help topic of an outcome number; false when the number has none.
    virtual bool ShowOutcome(int outcome) = 0;
    // Waits for one message of the thread and dispatches it; returns whether the help is
    // still open.
    virtual bool PumpMessage() = 0;
    // Whether the help is open now, without waiting for anything.
    virtual bool HelpOpen() const = 0;
};
