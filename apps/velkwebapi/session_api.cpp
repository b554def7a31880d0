#include <climits>

#include "apis.h"
#include "operations/json_form.h"
#include "operations/sessions.h"
#include "parameters.h"
#include "velksharing/constants.h"

namespace webapi {
namespace {

using namespace operations;
using namespace VELK::sharing;

std::vector<Parameter> ListParameters() {
  std::vector<Parameter> parameters = PageParameters();
  parameters.push_back({"account", ACCOUNT, OPTIONAL, "Only this account's."});
  parameters.push_back({SZK_IP_, ADDRESS, OPTIONAL, "Only from this address."});
  return parameters;
}

Json::Value List(Parameters &parameters) {
  SessionQuery query;
  query.uid = parameters.Account("account");
  query.address = parameters.Text(SZK_IP_);
  query.page = ToPage(parameters);
  return WithItems(ToJson(ListSessions(SharingDatabase(), query), query.page), "sessions");
}

Json::Value Delete(Parameters &parameters) {
  const int id = static_cast<int>(*parameters.Integer(SZK_ID_));
  DeleteSession(SharingDatabase(), id);
  Json::Value data(Json::objectValue);
  data[SZK_ID_] = id;
  return data;
}

}  // namespace

Api SessionApi() {
  return {"VELK.Sharing.Session",
          1,
          {
              {"list", "Lists live sessions, the newest first.", ListParameters(), List},
              {"delete",
               "Deletes a session: its visitor is logged out of every link.",
               {{SZK_ID_, INTEGER, REQUIRED, "The session's row id, as the list gives it.", 1,
                 INT_MAX}},
               Delete},
          }};
}

}  // namespace webapi
