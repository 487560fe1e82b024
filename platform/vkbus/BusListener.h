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
    void OnSessionOver() override;
    void OnConnect() override;
    void OnTimer() override;
    void OnClose() override;
    void Pause();
    void Resume();
    void SetTimer();

    const BusSessionTerms termsM;
    BusAddress addressM;
    BusFd listeningM;
    bool fPausedM = false;  // for want of descriptors
};
