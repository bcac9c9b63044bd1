#ifndef TESTS_SUPPORT_LOOPBACKLISTENER_H
#define TESTS_SUPPORT_LOOPBACKLISTENER_H

// A listening socket on an ephemeral loopback port that nobody serves: a test points a reference
// or a URL at it and then proves that no connection was ever made.

namespace TestSupport {

class LoopbackListener {
 public:
  LoopbackListener();
  ~LoopbackListener();
  LoopbackListener(const LoopbackListener&) = delete;
  LoopbackListener& operator=(const LoopbackListener&) = delete;

  int GetPort() const { return _port; }
  // Accepts and closes what is queued; the number of connections received so far.
  int CountConnections() const;

 private:
  int _socket;
  int _port = 0;
};

}  // namespace TestSupport

#endif
