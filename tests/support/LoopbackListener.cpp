#include "support/LoopbackListener.h"

#include <arpa/inet.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

#include <cerrno>

#include <gtest/gtest.h>

namespace TestSupport {

LoopbackListener::LoopbackListener() : _socket(socket(AF_INET, SOCK_STREAM | SOCK_NONBLOCK, 0)) {
  sockaddr_in address{};
  address.sin_family = AF_INET;
  address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
  socklen_t length = sizeof address;
  EXPECT_EQ(0, bind(_socket, reinterpret_cast<sockaddr*>(&address), length));
  EXPECT_EQ(0, listen(_socket, 8));
  EXPECT_EQ(0, getsockname(_socket, reinterpret_cast<sockaddr*>(&address), &length));
  _port = ntohs(address.sin_port);
}

LoopbackListener::~LoopbackListener() { close(_socket); }

int LoopbackListener::CountConnections() const {
  int count = 0;
  for (int client; (client = accept(_socket, nullptr, nullptr)) >= 0; ++count) close(client);
  EXPECT_TRUE(errno == EAGAIN || errno == EWOULDBLOCK) << "accept failed with errno " << errno;
  return count;
}

}  // namespace TestSupport
