// An application that asks the web API about a link.
//
//   webapi_client HASH

#include <json/writer.h>
#include <velksharing/utils.h>

#include <iostream>

int main(int argc, char **argv) {
  if (argc != 2) return 2;
  Json::Value params, reply;
  params["hash"] = argv[1];
  if (!VELK::sharing::SendWebapi(reply, "VELK.Sharing.Link", 1, "get", params)) return 1;
  Json::StreamWriterBuilder builder;
  builder["indentation"] = "  ";
  std::cout << Json::writeString(builder, reply) << '\n';
  return reply["success"].asBool() ? 0 : 1;
}
