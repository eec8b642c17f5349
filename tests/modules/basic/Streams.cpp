#include <iostream>
#include <string>

#include "Methods.h"

namespace basic {

void Print(APIRequest* request, APIResponse* response) {
    std::cout << request->GetParam("text", "").asString() << std::flush;
    Json::Value data(Json::objectValue);
    data["good"] = std::cout.good();
    response->SetSuccess(data);
}

void ReadInput(APIRequest*, APIResponse* response) {
    std::string text;
    for (char byte = 0; std::cin.get(byte);) {
        text += byte;
    }
    Json::Value data(Json::objectValue);
    data["text"] = text;
    data["end"] = std::cin.eof();
    response->SetSuccess(data);
}

void Download(APIRequest* request, APIResponse* response) {
    response->SetEnableOutput(false);
    std::cout << "Content-Type: text/plain\r\n\r\n"
              << request->GetParam("text", "").asString() << std::flush;
    response->SetSuccess(Json::Value());
}

}  // namespace basic
