#include "tests/contract/SessionWorld.h"
#include "tests/fake/FakePlatform.h"

namespace {

class FakeSessionWorld : public SessionWorld {
  public:
    FakeSessionWorld() {
        fake::Reset();
    }
    ~FakeSessionWorld() override {
        fake::Reset();
    }

    std::string LogIn(const Login& login) override {
        const std::string id = "s" + std::to_string(fake::Now().sessions.size());
        fake::Session& session = fake::Now().sessions[id];
        session.user = login.user;
        session.result = session.timeoutAllowed = login.administrator ? 2 : 1;
        session.file = FileOf(id);
        session.language = login.language.empty() ? session.language : login.language;
        SetOption(&session, 1, login.exempt ? "1" : "");
        SetOption(&session, 6, login.privilege);
        SetOption(&session, 7, login.application);
        SetOption(&session, 10, login.timeout > 0 ? std::to_string(login.timeout) : "");
        if (login.administrator) {
            fake::Now().administrators.insert(login.user);
        }
        fake::Now().uids.emplace(login.user, 1024 + static_cast<int>(fake::Now().uids.size()));
        return id;
    }
    void TimeOut(const std::string& id) override {
        fake::Now().sessions[id].result = -1;
    }
    void LogOut(const std::string& id) override {
        fake::Now().sessions.erase(id);
    }
    void RemoveAccount(const std::string& id) override {
        Answer(id, -6);
        fake::Now().uids.erase(fake::Now().sessions[id].user);
    }
    void AskFromAnotherAddress(const std::string& id) override {
        Answer(id, -3);
    }
    void AskFromAnotherSite(const std::string& id) override {
        Answer(id, -4);
    }
    void ComeFrom(const std::string& address) override {
        fake::Now().remoteAddress = address;
    }
    void Grant(const std::string& user, const std::string& privilege) override {
        fake::Now().privileges.insert(user + "/" + privilege);
    }
    int UidOf(const std::string& user) override {
        return fake::Now().uids[user];
    }
    std::string FileOf(const std::string& id) override {
        return fake::Now().sessionDir + "/" + id;
    }

  private:
    static void SetOption(fake::Session* session, int option, const std::string& text) {
        if (!text.empty()) {
            session->options[option] = text;
        }
    }
    static void Answer(const std::string& id, int result) {
        fake::Now().sessions[id].result = fake::Now().sessions[id].timeoutAllowed = result;
    }
};

}  // namespace

std::unique_ptr<SessionWorld> MakeSessionWorld() {
    return std::make_unique<FakeSessionWorld>();
}
