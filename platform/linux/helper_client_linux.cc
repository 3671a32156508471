// SPDX-License-Identifier: MIT
// vorn::HelperClient over sd-bus.
#include "platform/helper_client.h"
#include "platform/linux/bus_link.h"
#include "platform/linux/bus_message.h"

namespace vorn {
namespace {

using namespace std::chrono_literals;

constexpr bus::CallTarget kHelperPerform{protocol::kHelperBusName, protocol::kHelperObjectPath,
                                         protocol::kHelperInterface, protocol::kPerformMethod};

class BusHelperClient final : public HelperClient {
 public:
  explicit BusHelperClient(std::string clientName) : clientName_(std::move(clientName)) {}

  TelephonyXPC::Result perform(helper::TaskID task, const char* command, xpc::dict request,
                               xpc::dict& response) override {
    auto reply = std::make_shared<bus::SyncReply>();
    auto args = [client = clientName_, task, cmd = std::string(command ? command : ""),
                 body = request.obj()](sd_bus_message* m) {
      return sd_bus_message_append(m, "sus", client.c_str(), std::uint32_t(task), cmd.c_str()) >=
                 0 &&
             bus::appendDictionary(m, body);
    };
    link_.call(kHelperPerform, std::move(args), bus::callTimeout(15min),
               [reply](const bus::CallOutcome& outcome) {
                 TelephonyXPC::Result result{outcome.status, outcome.description};
                 xpc::object answer;
                 if (outcome.status == 0 &&
                     !bus::readResultReply(outcome.message, result.status, result.description,
                                           answer))
                   result = {status::kMalformedReply, "reply has an unexpected signature"};
                 reply->deliver(std::move(result), std::move(answer));
               });
    xpc::object answer;
    auto result = reply->wait(answer);
    response = xpc::dict(answer);
    return result;
  }

 private:
  std::string clientName_;
  bus::BusLink link_;
};

}  // namespace

std::shared_ptr<HelperClient> HelperClient::create(const char* clientName,
                                                   std::shared_ptr<rilx::LogServer>) {
  return std::make_shared<BusHelperClient>(clientName ? clientName : "");
}

}  // namespace vorn
