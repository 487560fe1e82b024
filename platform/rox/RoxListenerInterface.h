#pragma once

/// Somebody who is called when an Event happens: one word, the function. The function gets the listener
/// itself; a class that has more to know is derived from this, or finds itself from the listener's address.
template <class Event>
class RoxListenerInterface {
 public:
    using Function = void (*)(RoxListenerInterface* listener);

    constexpr explicit RoxListenerInterface(Function function) : functionM(function) {}

    void Call() { functionM(this); }

 private:
    Function functionM;
};
