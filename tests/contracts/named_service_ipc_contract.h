// What platform/named_service_ipc.h promises. Verbs: serve(service), which answers from now on.

#pragma once

#include <unistd.h>

#include <array>
#include <memory>
#include <string>
#include <vector>

#include "platform/named_service_ipc.h"
#include "platform/token_framework.h"
#include "tests/contracts/contract_test.h"

namespace vlm::contracts {

template <typename Backend>
class NamedServiceIpcContract : public ContractTest<Backend> {
protected:
    static constexpr std::string_view kService = "org.vlm.test.service";

    static platform::Message echo(const platform::Message& request) { return request; }

    std::unique_ptr<platform::Connection> connected() {
        auto connection = this->backend().get().connect(kService, platform::ServiceScope::Machine);
        connection->resume();
        return connection;
    }

    static void expectFailed(const platform::Message& reply) {
        std::optional<platform::Error> error;
        EXPECT_FALSE(platform::decodeReplyError(reply, &error));
        ASSERT_TRUE(error);
        EXPECT_EQ(error->domain, platform::VLErrorDomain);
        EXPECT_FALSE(error->description().empty());
        EXPECT_EQ(reply.entries().size(), 1U) << "nothing but the error";
    }
};

TYPED_TEST_SUITE_P(NamedServiceIpcContract);

TYPED_TEST_P(NamedServiceIpcContract, CarriesEveryTypeBothWaysInOrder) {
    this->backend().serve(this->echo);
    platform::Message request;
    request.set("op", std::uint64_t{0xFFFFFFFFFFFFFFFFU});
    request.set("uid", std::int64_t{-1});
    request.set("str1", std::string("gr\xC3\xBC\xC3\x9F"));
    request.set("dat1", platform::Bytes{0, 1, 0xFF});
    request.set("str2", std::string());
    request.set("a", platform::Bytes{});

    const auto reply = this->connected()->sendAndWait(request);

    EXPECT_EQ(reply, request);
}

TYPED_TEST_P(NamedServiceIpcContract, CarriesAnEmptyDictionary) {
    this->backend().serve(this->echo);

    const auto reply = this->connected()->sendAndWait({});

    EXPECT_TRUE(reply.entries().empty());
}

TYPED_TEST_P(NamedServiceIpcContract, CarriesAnEndpointThatWorks) {
    this->backend().serve(this->echo);
    std::array<int, 2> ends{};
    ASSERT_EQ(::pipe(ends.data()), 0);
    platform::Message request;
    request.set("dat1", platform::Endpoint{
                            std::shared_ptr<const int>(new int(ends[1]), [](const int* number) {
                                ::close(*number);
                                delete number;
                            })});

    const auto reply = this->connected()->sendAndWait(request);

    const auto endpoint = reply.endpoint("dat1");
    ASSERT_TRUE(endpoint && endpoint->descriptor);
    EXPECT_EQ(::write(*endpoint->descriptor, "x", 1), 1);
    char arrived = 0;
    EXPECT_EQ(::read(ends[0], &arrived, 1), 1);
    EXPECT_EQ(arrived, 'x');
    ::close(ends[0]);
}

TYPED_TEST_P(NamedServiceIpcContract, CarriesAMebibyte) {
    this->backend().serve(this->echo);
    platform::Message request;
    request.set("dat1", platform::Bytes(std::size_t{1} << 20U, 0x5A));

    const auto reply = this->connected()->sendAndWait(request);

    EXPECT_EQ(reply, request);
}

TYPED_TEST_P(NamedServiceIpcContract, HandsTheServicesOwnErrorOnUnchanged) {
    const platform::Error refused{std::string(platform::VLErrorDomain), -2001, "not you"};
    this->backend().serve([&](const platform::Message&) {
        platform::Message reply;
        reply.set("res", std::int64_t{-2001});
        platform::encodeReplyError(refused, &reply);
        return reply;
    });

    const auto reply = this->connected()->sendAndWait({});

    std::optional<platform::Error> error;
    EXPECT_FALSE(platform::decodeReplyError(reply, &error));
    EXPECT_EQ(error, refused);
    EXPECT_EQ(reply.integer("res"), -2001);
}

TYPED_TEST_P(NamedServiceIpcContract, ServesSeveralExchangesOnOneConnection) {
    this->backend().serve(this->echo);
    const auto connection = this->connected();

    for (std::int64_t number = 0; number < 3; ++number) {
        platform::Message request;
        request.set("uid", number);
        EXPECT_EQ(connection->sendAndWait(request).integer("uid"), number);
    }
}

TYPED_TEST_P(NamedServiceIpcContract, KeepsConnectionsApart) {
    this->backend().serve(this->echo);
    auto first = this->connected();
    const auto second = this->connected();
    first->sendAndWait({});

    first.reset();

    platform::Message request;
    request.set("uid", std::int64_t{2});
    EXPECT_EQ(second->sendAndWait(request), request);
}

TYPED_TEST_P(NamedServiceIpcContract, SendsNothingBeforeItIsResumed) {
    int served = 0;
    this->backend().serve([&](const platform::Message& request) {
        ++served;
        return request;
    });
    const auto connection =
        this->backend().get().connect(this->kService, platform::ServiceScope::Machine);

    const auto reply = connection->sendAndWait({});

    this->expectFailed(reply);
    EXPECT_EQ(served, 0);
}

TYPED_TEST_P(NamedServiceIpcContract, AnswersWithAnErrorAndTheEventWhenThereIsNoService) {
    std::vector<platform::ConnectionEvent> events;
    const auto connection =
        this->backend().get().connect(this->kService, platform::ServiceScope::Machine);
    connection->setEventHandler([&](auto event) { events.push_back(event); });
    connection->resume();

    const auto reply = connection->sendAndWait({});

    this->expectFailed(reply);
    EXPECT_EQ(events, std::vector{platform::ConnectionEvent::Invalid});
}

TYPED_TEST_P(NamedServiceIpcContract, NeedsNoEventHandler) {
    this->expectFailed(this->connected()->sendAndWait({}));
}

TYPED_TEST_P(NamedServiceIpcContract, FindsAServiceThatComesLater) {
    const auto connection = this->connected();
    connection->sendAndWait({});
    this->backend().serve(this->echo);
    platform::Message request;
    request.set("uid", std::int64_t{7});

    EXPECT_EQ(connection->sendAndWait(request), request);
}

REGISTER_TYPED_TEST_SUITE_P(NamedServiceIpcContract, CarriesEveryTypeBothWaysInOrder,
                            CarriesAnEmptyDictionary, CarriesAnEndpointThatWorks, CarriesAMebibyte,
                            HandsTheServicesOwnErrorOnUnchanged,
                            ServesSeveralExchangesOnOneConnection, KeepsConnectionsApart,
                            SendsNothingBeforeItIsResumed,
                            AnswersWithAnErrorAndTheEventWhenThereIsNoService, NeedsNoEventHandler,
                            FindsAServiceThatComesLater);

}  // namespace vlm::contracts
