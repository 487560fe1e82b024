#pragma once

class RoxMempool;

/// A module of the process that is started and stopped in the order of its dependencies. An object with
/// static storage, which enters itself in the list of all modules while the library loads and leaves it when
/// the library unloads. It allocates nothing and uses no other module's record before StartAll, so the order
/// in which records are made does not matter.
///
/// StartAll and StopAll are called by one thread at a time, and not by a module's start or stop; libraries
/// may be loaded by other threads meanwhile.
class RoxInitInfo {
 public:
    using Start = unsigned (*)(RoxMempool* pool);
    using Stop = void (*)();

    /// `start` gives 0 or, when it fails, a number of its own; it and `stop` may be null. `name` and the
    /// table of the nDependencies records that have to run before this one are borrowed for good. The last
    /// two arguments are reserved: 0 and null.
    RoxInitInfo(const char* name, Start start, Stop stop, unsigned nDependencies,
                RoxInitInfo* const* vDependencies, int reserved, void* reservedPointer);
    /// Leaves the list without calling `stop`: whoever unloads a library that runs calls StopAll before.
    ~RoxInitInfo();
    RoxInitInfo(const RoxInitInfo&) = delete;
    RoxInitInfo& operator=(const RoxInitInfo&) = delete;

    /// Starts every module that does not run, each after its dependencies; among those that could be next
    /// the one whose name comes first by `strcmp`. Every start gets `pool`, which has to live until StopAll
    /// has returned. Gives 0, or the number of the first start that failed: then the log has a line, and the
    /// modules that this call had started are stopped again, the last one first.
    ///
    /// Dependencies in a ring, or on a record that is not in the list, end in RoxAssertFail with the names.
    static unsigned StartAll(RoxMempool* pool);
    /// Stops every module that runs, the one that started last first.
    static void StopAll();

    const char* GetName() const { return nameM; }
    /// Whether `start` has succeeded and `stop` was not called since.
    bool FRunning() const { return fRunningM; }

 private:
    bool FListed() const;
    bool FReady() const;
    static RoxInitInfo* FirstReady();
    static RoxInitInfo* FirstThatWaits();
    const RoxInitInfo* FirstMissing() const;
    [[noreturn]] static void FailOverRing(const RoxInitInfo* waiting);
    static void StopDownTo(const RoxInitInfo* last);

    const char* nameM;
    Start startM;
    Stop stopM;
    unsigned nDependenciesM;
    RoxInitInfo* const* vDependenciesM;
    RoxInitInfo* pNextM = nullptr;           // in the list of all records, by name
    RoxInitInfo* pStartedBeforeM = nullptr;  // in the list of those that run, the last one first
    bool fRunningM = false;
};
