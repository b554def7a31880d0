#include "apis.h"
#include "operations/blocks.h"
#include "operations/json_form.h"
#include "parameters.h"

namespace webapi {
namespace {

using namespace operations;

constexpr long kTenYears = 315360000;  // seconds

const Parameter kAddress = {"address", NETWORK, REQUIRED,
                            "The address; an IPv6 address counts by its /64 network."};

Json::Value AddressToJson(const std::string &address) {
  Json::Value data(Json::objectValue);
  data["address"] = address;
  return data;
}

Json::Value List(Parameters &parameters) {
  Json::Value list = ToJson(ListBlocks(parameters.Boolean("all").value_or(false)));
  list["total"] = list["blocks"].size();
  return WithItems(std::move(list), "blocks");
}

Json::Value Add(Parameters &parameters) {
  const std::string address = parameters.RequiredText("address");
  AddBlock(address, parameters.Integer("seconds").value_or(0));
  return AddressToJson(address);
}

Json::Value Remove(Parameters &parameters) {
  const std::string address = parameters.RequiredText("address");
  RemoveBlock(address);
  return AddressToJson(address);
}

}  // namespace

Api BlockApi() {
  return {"VELK.Sharing.Block",
          1,
          {
              {"list",
               "Lists blocked addresses.",
               {{"all", BOOLEAN, OPTIONAL,
                 "Also addresses that have failed but are not blocked; false when not given."}},
               List},
              {"add",
               "Blocks an address.",
               {kAddress,
                {"seconds", INTEGER, OPTIONAL, "How long from now; 0 or not given: for ever.", 0,
                 kTenYears}},
               Add},
              {"remove", "Forgets the block and the failures of an address.", {kAddress}, Remove},
          }};
}

}  // namespace webapi
