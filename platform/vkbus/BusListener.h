#pragma once

#include "vkbus/BusAddress.h"
#include "vkbus/BusEndpoint.h"

/// A service's end: the listening socket, and the sessions of those who have come.
class BusListener : public BusEndpoint {
 public:
    /// Listens on the address and makes the handle known.
    static unsigned Open(const BusSessionTerms& terms, uint32_t* handle);

    explicit BusListener(const BusSessionTerms& terms) : termsM(terms) {}
    ~BusListener() override;

 private:
    void OnSessionOver(uint32_t session) override;
    void OnConnect() override;
    void OnTimer() override;
    void OnClose() override;
    bool FRoomFor(pid_t process) const;
    unsigned NInUse(pid_t process) const;
    void Pause();
    void Resume();
    void SetTimer();

    const BusSessionTerms termsM;
    BusAddress addressM;
    BusFd listeningM;
    std::unordered_map<uint32_t, pid_t> processesM;  // of the sessions
    bool fPausedM = false;                           // for want of descriptors
};
