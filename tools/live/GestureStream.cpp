#include "GestureStream.h"

#include <fcntl.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/un.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <cstring>

#include "tools/formats/EventJson.h"

namespace orvane::live {

namespace {

bool isGestureEvent(uint32_t type) {
    return type == kHIDEventTypeScale || type == kHIDEventTypeRotation || type == kHIDEventTypeScroll;
}

bool socketAddress(const std::string& path, sockaddr_un* address, std::string* error) {
    std::memset(address, 0, sizeof(*address));
    address->sun_family = AF_UNIX;
    if (path.empty() || path.size() >= sizeof(address->sun_path)) {
        *error = path + ": a socket path must have 1 to " + std::to_string(sizeof(address->sun_path) - 1) +
                 " characters";
        return false;
    }
    std::memcpy(address->sun_path, path.data(), path.size());
    return true;
}

// True when something accepts connections on the socket file at `address`.
bool answers(const sockaddr_un& address) {
    const int probe = ::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
    if (probe < 0) return false;
    const bool connected = ::connect(probe, reinterpret_cast<const sockaddr*>(&address), sizeof(address)) == 0;
    ::close(probe);
    return connected;
}

}  // namespace

GestureStream::GestureStream(size_t clientBufferBytes) : clientBufferBytes_(clientBufferBytes) {}

GestureStream::~GestureStream() {
    for (Client& c : clients_) ::close(c.descriptor);
    if (listener_ >= 0) {
        ::close(listener_);
        ::unlink(path_.c_str());
    }
}

bool GestureStream::listen(const std::string& path, std::string* error) {
    sockaddr_un address;
    if (!socketAddress(path, &address, error)) return false;
    struct stat st {};
    if (::lstat(path.c_str(), &st) == 0) {
        if (!S_ISSOCK(st.st_mode)) {
            *error = path + ": exists and is not a socket";
            return false;
        }
        if (answers(address)) {
            *error = path + ": another program is already serving this socket";
            return false;
        }
        ::unlink(path.c_str());  // left behind by a process that is gone
    }
    const int s = ::socket(AF_UNIX, SOCK_STREAM | SOCK_NONBLOCK | SOCK_CLOEXEC, 0);
    if (s < 0) {
        *error = std::string("cannot make the gesture socket: ") + std::strerror(errno);
        return false;
    }
    if (::bind(s, reinterpret_cast<const sockaddr*>(&address), sizeof(address)) != 0 || ::listen(s, 8) != 0) {
        *error = path + ": cannot listen: " + std::strerror(errno);
        ::close(s);
        return false;
    }
    listener_ = s;
    path_ = path;
    return true;
}

void GestureStream::printTo(int descriptor) { printed_ = descriptor; }

void GestureStream::deliver(const HIDEvent& event) {
    if (listener_ < 0 && printed_ < 0) return;
    if (isGestureEvent(event.type())) {
        line_.clear();
        formats::appendEventJson(line_, event);
        publish(line_);
    }
    for (const HIDEventRef& child : event.children()) {
        if (!child || !isGestureEvent(child->type())) continue;
        line_.clear();
        formats::appendEventJson(line_, *child);
        publish(line_);
    }
}

void GestureStream::publish(std::string_view line) {
    ++linesPublished_;
    print(line);
    for (size_t i = clients_.size(); i-- > 0;) {
        Client& c = clients_[i];
        if (c.waiting.size() - c.taken + line.size() + 1 > clientBufferBytes_) {
            drop(i);  // it fell too far behind
            continue;
        }
        if (c.taken == c.waiting.size()) {
            c.waiting.clear();
            c.taken = 0;
        }
        c.waiting.append(line);
        c.waiting.push_back('\n');
        if (!send(c)) drop(i);
    }
}

void GestureStream::print(std::string_view line) {
    if (printed_ < 0) return;
    // Standard output is not made non-blocking (that would change it for every process
    // sharing it, standard error too); a line goes out only when there is room for it now.
    pollfd p{printed_, POLLOUT, 0};
    if (::poll(&p, 1, 0) < 0 || (p.revents & (POLLERR | POLLHUP | POLLNVAL))) {
        ++printedLinesLeftOut_;
        if (p.revents & (POLLERR | POLLHUP | POLLNVAL)) printed_ = -1;  // the reader is gone
        return;
    }
    if (!(p.revents & POLLOUT)) {
        ++printedLinesLeftOut_;
        return;
    }
    printing_.assign(line);
    printing_.push_back('\n');
    size_t done = 0;
    while (done < printing_.size()) {
        const ssize_t n = ::write(printed_, printing_.data() + done, printing_.size() - done);
        if (n > 0) {
            done += static_cast<size_t>(n);
        } else if (n < 0 && errno == EINTR) {
            continue;
        } else {
            ++printedLinesLeftOut_;
            printed_ = -1;  // the reader is gone
            return;
        }
    }
}

bool GestureStream::send(Client& client) {
    while (client.taken < client.waiting.size()) {
        const ssize_t n = ::send(client.descriptor, client.waiting.data() + client.taken,
                                 client.waiting.size() - client.taken, MSG_NOSIGNAL | MSG_DONTWAIT);
        if (n > 0) {
            client.taken += static_cast<size_t>(n);
        } else if (n < 0 && errno == EINTR) {
            continue;
        } else if (n < 0 && (errno == EAGAIN || errno == EWOULDBLOCK)) {
            return true;  // the rest waits for the client
        } else {
            return false;  // it has gone
        }
    }
    client.waiting.clear();
    client.taken = 0;
    return true;
}

void GestureStream::drop(size_t index) {
    ::close(clients_[index].descriptor);
    clients_.erase(clients_.begin() + static_cast<std::ptrdiff_t>(index));
    ++clientsDropped_;
}

void GestureStream::accept() {
    if (listener_ < 0) return;
    for (;;) {
        const int c = ::accept4(listener_, nullptr, nullptr, SOCK_NONBLOCK | SOCK_CLOEXEC);
        if (c < 0) {
            if (errno == EINTR) continue;
            return;  // none waiting, or a connection that went away before it was taken
        }
        if (clients_.size() >= kMaximumClients) {
            ::close(c);
            continue;
        }
        Client client;
        client.descriptor = c;
        client.waiting.reserve(clientBufferBytes_);
        clients_.push_back(std::move(client));
    }
}

void GestureStream::service() {
    accept();
    char discard[512];
    for (size_t i = clients_.size(); i-- > 0;) {
        Client& c = clients_[i];
        bool gone = false;
        for (;;) {
            const ssize_t n = ::recv(c.descriptor, discard, sizeof(discard), MSG_DONTWAIT);
            if (n > 0) continue;  // clients have nothing to say; what they send is ignored
            if (n == 0) gone = true;
            else if (errno == EINTR) continue;
            else if (errno != EAGAIN && errno != EWOULDBLOCK) gone = true;
            break;
        }
        if (gone || !send(c)) drop(i);
    }
}

void GestureStream::appendPollDescriptors(std::vector<pollfd>* descriptors) const {
    if (listener_ >= 0) descriptors->push_back({listener_, POLLIN, 0});
    for (const Client& c : clients_) {
        const short events = static_cast<short>(POLLIN | (c.taken < c.waiting.size() ? POLLOUT : 0));
        descriptors->push_back({c.descriptor, events, 0});
    }
}

void GestureStream::flush(int milliseconds) {
    const auto deadline = std::chrono::steady_clock::now() + std::chrono::milliseconds(milliseconds);
    for (;;) {
        std::vector<pollfd> waiting;
        for (size_t i = clients_.size(); i-- > 0;)
            if (!send(clients_[i])) drop(i);
        for (const Client& c : clients_)
            if (c.taken < c.waiting.size()) waiting.push_back({c.descriptor, POLLOUT, 0});
        const auto left =
            std::chrono::duration_cast<std::chrono::milliseconds>(deadline - std::chrono::steady_clock::now());
        if (waiting.empty() || left.count() <= 0) return;
        ::poll(waiting.data(), waiting.size(), static_cast<int>(left.count()));
    }
}

}  // namespace orvane::live
