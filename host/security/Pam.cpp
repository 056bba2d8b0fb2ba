#include "host/security/Gatekeeper.h"
#include "host/security/Secret.h"

#include <cstdlib>
#include <cstring>
#include <memory>
#include <mutex>
#include <stdexcept>

#include <security/pam_appl.h>

namespace marlo::security {

namespace {

/** What the conversation answers, and whether it has. */
struct Conversation {
    const std::string& password;
    bool answered = false;
};

/** PAM frees answers and their texts with free(3). */
struct FreeAnswers {
    int count = 0;

    void operator()(pam_response* answers) const {
        for (int index = 0; index < count; ++index) {
            if (char* text = answers[index].resp; text != nullptr) {
                explicit_bzero(text, std::strlen(text));
                std::free(text);
            }
        }
        std::free(answers);
    }
};

/** Answers one message; a password is asked for once, and nothing else is known. */
bool answer(const pam_message& message, pam_response& response, Conversation& conversation) {
    if (message.msg_style == PAM_TEXT_INFO || message.msg_style == PAM_ERROR_MSG) {
        return true;
    }
    if (message.msg_style != PAM_PROMPT_ECHO_OFF || conversation.answered) {
        return false;
    }
    conversation.answered = true;
    response.resp = strdup(conversation.password.c_str());
    return response.resp != nullptr;
}

int converse(int count, const pam_message** messages, pam_response** responses, void* data) {
    if (count <= 0 || count > PAM_MAX_NUM_MSG) {
        return PAM_CONV_ERR;
    }
    auto* array = static_cast<pam_response*>(std::calloc(static_cast<std::size_t>(count), sizeof(pam_response)));
    std::unique_ptr<pam_response, FreeAnswers> answers(array, FreeAnswers{count});
    if (!answers) {
        return PAM_BUF_ERR;
    }
    for (int index = 0; index < count; ++index) {
        if (!answer(*messages[index], array[index], *static_cast<Conversation*>(data))) {
            return PAM_CONV_ERR;
        }
    }
    *responses = answers.release();
    return PAM_SUCCESS;
}

/** In the place of PAM's own sleep after a failure: the gatekeeper waits, and not while others want to ask. */
void doNotWait(int /*result*/, unsigned /*microseconds*/, void* /*data*/) {}

/** One conversation with PAM. */
class Transaction {
  public:
    Transaction(const std::string& service, const std::string& directory, const std::string& user,
                Conversation& conversation) {
        const pam_conv callback{&converse, &conversation};
        const char* place = directory.empty() ? nullptr : directory.c_str();
        _result = pam_start_confdir(service.c_str(), user.c_str(), &callback, place, &_handle);
        if (_result != PAM_SUCCESS) {
            throw std::runtime_error("PAM service \"" + service + "\": " + pam_strerror(_handle, _result));
        }
    }

    ~Transaction() { pam_end(_handle, _result); }

    Transaction(const Transaction&) = delete;
    Transaction& operator=(const Transaction&) = delete;

    bool isGood() {
        using Delay = void (*)(int, unsigned, void*);
        const Delay delay = &doNotWait;
        void* item = nullptr;
        std::memcpy(&item, &delay, sizeof item); // a function by a pointer to data: PAM has no other way
        _result = pam_set_item(_handle, PAM_FAIL_DELAY, item);
        constexpr int flags = PAM_SILENT | PAM_DISALLOW_NULL_AUTHTOK;
        if (_result == PAM_SUCCESS) {
            _result = pam_authenticate(_handle, flags);
        }
        if (_result == PAM_SUCCESS) {
            _result = pam_acct_mgmt(_handle, flags);
        }
        return _result == PAM_SUCCESS;
    }

  private:
    pam_handle_t* _handle = nullptr;
    int _result = PAM_SUCCESS;
};

class PamCheck final : public PasswordCheck {
  public:
    PamCheck(std::string service, std::string directory)
        : _service(std::move(service)), _directory(std::move(directory)) {}

    bool isGood(const std::string& user, const std::string& password) override {
        if (password.size() >= PAM_MAX_RESP_SIZE) {
            return false;
        }
        static std::mutex mutex; // of all services: modules are shared
        const std::lock_guard<std::mutex> lock(mutex);
        Conversation conversation{password};
        return Transaction(_service, _directory, user, conversation).isGood();
    }

  private:
    const std::string _service;
    const std::string _directory;
};

} // namespace

std::unique_ptr<PasswordCheck> makePamCheck(const std::string& service, const std::string& directory) {
    return std::make_unique<PamCheck>(service, directory);
}

} // namespace marlo::security
