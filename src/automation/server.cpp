#include "automation/server.h"

#include "automation/dispatcher.h"
#include "automation/dispatcherror.h"
#include "automation/handletable.h"
#include "automation/jsontext.h"
#include "automation/linechannel.h"
#include "automation/registry.h"
#include "automation/typelibrary.h"
#include "automation/valuecodec.h"
#include "core/comerror.h"
#include "core/eventsource.h"

#include <QCborArray>
#include <QCborMap>
#include <QLoggingCategory>
#include <algorithm>
#include <set>
#include <unordered_map>

Q_LOGGING_CATEGORY(lcServer, "ludmox.automation.server")

namespace automation {

namespace {
namespace Code {
constexpr int ComponentError = -32000;
constexpr int InvalidRequest = -32600;
constexpr int MethodNotFound = -32601;
constexpr int InvalidParams = -32602;
constexpr int ParseError = -32700;
} // namespace Code

// An unexpected failure inside the component that is no automation error.
constexpr int32_t unexpectedFailure = static_cast<int32_t>(0x8000FFFF);

// Nested event waits beyond this depth would only come from a host that answers every
// event with a call that raises the next one; the event is then raised to no one.
constexpr int maxNesting = 64;

/// A request the server cannot serve, answered with a JSON-RPC error.
struct RpcError {
    int code;
    QString message;
    QCborValue data = QCborValue(QCborValue::Undefined);
};

QString str(const char* text)
{
    return QString::fromLatin1(text);
}

std::optional<MemberKind> parseKind(const QCborValue& value)
{
    if (value.isUndefined() || value.isNull())
        return std::nullopt;
    const QString text = value.toString();
    for (MemberKind kind :
        { MemberKind::Method, MemberKind::Get, MemberKind::Put, MemberKind::PutRef }) {
        if (text == memberKindName(kind))
            return kind;
    }
    throw RpcError { Code::InvalidParams,
        QStringLiteral("kind must be method, get, put or putref") };
}

bool isResponse(const QCborMap& message)
{
    return !message.contains(QStringLiteral("method"))
        && (message.contains(QStringLiteral("result"))
            || message.contains(QStringLiteral("error")));
}

QCborMap dispatchErrorData(const DispatchError& error)
{
    QCborMap data;
    data.insert(QStringLiteral("number"), error.number());
    data.insert(QStringLiteral("description"), error.description());
    if (error.argumentIndex())
        data.insert(QStringLiteral("argument"), *error.argumentIndex());
    return data;
}
} // namespace

class Server::Private {
public:
    Private(int input, int output, const Registry& classes)
        : channel(input, output)
        , registry(classes)
        , dispatcher(classes)
        , codec(handles)
    {
        handles.setDroppingHandler([this](HandleTable::Handle handle) { disconnect(handle); });
    }
    ~Private() { releaseAll(); }

    size_t releaseAll();
    int run();
    void handleRequest(const QCborMap& request);
    QCborValue call(const QString& method, const QCborMap& params);
    std::optional<QCborMap> parse(const LineChannel::Line& line);

    QCborValue create(const QCborMap& params);
    QCborValue invoke(const QCborMap& params);
    QCborValue enumerate(const QCborMap& params);
    QCborValue connect(const QCborMap& params);
    std::optional<std::vector<int32_t>> subscribedEvents(
        const ClassDescription& description, const QCborValue& names);
    QCborValue release(const QCborMap& params);
    core::ObjectPtr requireObject(const QCborMap& params, HandleTable::Handle* handle = nullptr);

    void disconnect(HandleTable::Handle handle);
    void raiseEvent(HandleTable::Handle handle, int32_t dispid, const QString& name,
        std::span<core::Variant> args);
    void applyEventResult(HandleTable::Handle handle, int32_t dispid, const QCborValue& result,
        std::span<core::Variant> args);
    std::optional<QCborMap> waitForResponse(qint64 id);

    void send(const QCborMap& message);
    void reply(const QCborValue& id, const QCborValue& result);
    void replyError(const QCborValue& id, int code, const QString& message,
        const QCborValue& data = QCborValue(QCborValue::Undefined));

    struct Connection {
        core::EventSource* source = nullptr;
        int cookie = 0;
    };

    LineChannel channel;
    const Registry& registry;
    Dispatcher dispatcher;
    HandleTable handles;
    ValueCodec codec;
    std::unordered_map<HandleTable::Handle, Connection> connections;
    qint64 nextEventId = 1;
    std::set<qint64> waitingFor; // ids of events raised and not yet answered
    std::unordered_map<qint64, QCborMap> earlyAnswers; // answers to an outer event
    int nesting = 0;
};

int Server::Private::run()
{
    while (std::optional<LineChannel::Line> line = channel.readLine()) {
        const std::optional<QCborMap> message = parse(*line);
        if (!message)
            continue;
        if (isResponse(*message)) {
            qCWarning(lcServer) << "answer to no event:" << JsonText::serialize(*message);
            continue;
        }
        handleRequest(*message);
    }
    const size_t released = releaseAll();
    qCInfo(lcServer) << "input ended; released" << released << "objects";
    return 0;
}

size_t Server::Private::releaseAll()
{
    // Events first: objects that raise events while they go must not reach a host that is
    // gone.
    for (const auto& [handle, connection] : connections)
        connection.source->disconnect(connection.cookie);
    connections.clear();
    return handles.clear();
}

std::optional<QCborMap> Server::Private::parse(const LineChannel::Line& line)
{
    if (line.tooLong) {
        replyError(QCborValue(nullptr), Code::ParseError, str("Parse error: line too long"));
        return std::nullopt;
    }
    if (line.text.trimmed().isEmpty())
        return std::nullopt;
    QString error;
    const std::optional<QCborValue> value = JsonText::parse(line.text, &error);
    if (!value) {
        replyError(QCborValue(nullptr), Code::ParseError, QStringLiteral("Parse error: ") + error);
        return std::nullopt;
    }
    if (!value->isMap()) {
        replyError(QCborValue(nullptr), Code::InvalidRequest,
            str("Invalid Request: a message is a JSON object"));
        return std::nullopt;
    }
    return value->toMap();
}

void Server::Private::handleRequest(const QCborMap& request)
{
    const bool isNotification = !request.contains(QStringLiteral("id"));
    const QCborValue id
        = isNotification ? QCborValue(nullptr) : request.value(QStringLiteral("id"));
    if (!id.isNull() && !id.isInteger() && !id.isString() && !id.isDouble()) {
        replyError(QCborValue(nullptr), Code::InvalidRequest,
            str("Invalid Request: id must be a number or a string"));
        return;
    }
    const QCborValue method = request.value(QStringLiteral("method"));
    if (!method.isString()) {
        replyError(id, Code::InvalidRequest, str("Invalid Request: method must be a string"));
        return;
    }
    const QCborValue params = request.value(QStringLiteral("params"));
    auto answerError = [&](int code, const QString& message, const QCborValue& data) {
        if (!isNotification)
            replyError(id, code, message, data);
        else
            qCWarning(lcServer) << "notification" << method.toString() << "failed:" << message;
    };
    try {
        if (!params.isUndefined() && !params.isMap())
            throw RpcError { Code::InvalidParams, str("Invalid params: params must be an object") };
        const QCborValue result = call(method.toString(), params.toMap());
        if (!isNotification)
            reply(id, result);
        if (method.toString() == u"shutdown")
            channel.stop();
    } catch (const RpcError& error) {
        answerError(error.code, error.message, error.data);
    } catch (const DispatchError& error) {
        answerError(Code::InvalidParams, error.description(), dispatchErrorData(error));
    } catch (const core::ComError& error) {
        QCborMap data;
        data.insert(QStringLiteral("number"), error.number());
        data.insert(QStringLiteral("source"), error.source());
        data.insert(QStringLiteral("description"), error.description());
        answerError(Code::ComponentError,
            error.description().isEmpty() ? str("Component error") : error.description(), data);
    } catch (const std::exception& error) {
        QCborMap data;
        data.insert(QStringLiteral("number"), unexpectedFailure);
        data.insert(QStringLiteral("source"), QString());
        data.insert(QStringLiteral("description"), QString::fromLocal8Bit(error.what()));
        answerError(Code::ComponentError, str("Unexpected failure"), data);
    }
}

QCborValue Server::Private::call(const QString& method, const QCborMap& params)
{
    if (method == u"typelib")
        return TypeLibrary::describe(registry);
    if (method == u"create")
        return create(params);
    if (method == u"invoke")
        return invoke(params);
    if (method == u"enumerate")
        return enumerate(params);
    if (method == u"connect")
        return connect(params);
    if (method == u"disconnect") {
        HandleTable::Handle handle = 0;
        requireObject(params, &handle);
        disconnect(handle);
        return QCborMap();
    }
    if (method == u"release")
        return release(params);
    if (method == u"shutdown")
        return QCborMap();
    throw RpcError { Code::MethodNotFound, QStringLiteral("Method not found: ") + method };
}

core::ObjectPtr Server::Private::requireObject(const QCborMap& params, HandleTable::Handle* handle)
{
    const QCborValue value = params.value(QStringLiteral("object"));
    if (!value.isInteger())
        throw RpcError { Code::InvalidParams, str("Invalid params: object must be a handle") };
    core::ObjectPtr object = handles.object(value.toInteger());
    if (!object) {
        QCborMap data;
        data.insert(QStringLiteral("description"),
            QStringLiteral("Unknown object handle %1").arg(value.toInteger()));
        throw RpcError { Code::InvalidParams,
            QStringLiteral("Unknown object handle %1").arg(value.toInteger()), data };
    }
    if (handle)
        *handle = value.toInteger();
    return object;
}

QCborValue Server::Private::create(const QCborMap& params)
{
    const QCborValue className = params.value(QStringLiteral("class"));
    if (!className.isString())
        throw RpcError { Code::InvalidParams, str("Invalid params: class must be a name") };
    const ClassDescription* description = registry.find(className.toString());
    if (!description || !description->creatable) {
        const QString message = QStringLiteral("Class not creatable: ") + className.toString();
        QCborMap data;
        data.insert(QStringLiteral("number"), DispatchNumber::ClassNotRegistered);
        data.insert(QStringLiteral("description"), message);
        throw RpcError { Code::InvalidParams, message, data };
    }
    core::ObjectPtr object = description->factory();
    QCborMap result;
    result.insert(QStringLiteral("object"), handles.handOut(object));
    return result;
}

QCborValue Server::Private::invoke(const QCborMap& params)
{
    const core::ObjectPtr object = requireObject(params);
    const ClassDescription& description = dispatcher.describe(*object);
    const std::optional<MemberKind> kind = parseKind(params.value(QStringLiteral("kind")));
    const QCborValue memberName = params.value(QStringLiteral("member"));
    const QCborValue dispid = params.value(QStringLiteral("dispid"));
    const MemberDescription* member = nullptr;
    if (memberName.isString())
        member = &dispatcher.resolve(description, memberName.toString(), kind);
    else if (dispid.isInteger())
        member = &dispatcher.resolve(description, static_cast<int32_t>(dispid.toInteger()), kind);
    else
        throw RpcError { Code::InvalidParams,
            str("Invalid params: member must be a name or dispid a number") };

    const QCborValue argsValue = params.value(QStringLiteral("args"));
    if (!argsValue.isUndefined() && !argsValue.isArray())
        throw RpcError { Code::InvalidParams, str("Invalid params: args must be a list") };
    std::vector<core::Variant> args;
    const QCborArray passed = argsValue.toArray();
    for (qsizetype i = 0; i < passed.size(); ++i) {
        try {
            args.push_back(codec.decode(passed.at(i)));
        } catch (const ValueError& error) {
            if (error.kind() == ValueError::Kind::UnknownHandle) {
                QCborMap data;
                data.insert(QStringLiteral("description"), error.message());
                data.insert(QStringLiteral("argument"), i);
                throw RpcError { Code::InvalidParams, error.message(), data };
            }
            throw DispatchError::typeMismatch(static_cast<int>(i), error.message());
        }
    }

    const core::Variant value = dispatcher.invoke(object, *member, args);

    QCborMap result;
    result.insert(QStringLiteral("value"), codec.encode(value));
    QCborArray finalArgs;
    for (const core::Variant& arg : args)
        finalArgs.append(codec.encode(arg));
    result.insert(QStringLiteral("args"), finalArgs);
    return result;
}

QCborValue Server::Private::enumerate(const QCborMap& params)
{
    const core::ObjectPtr object = requireObject(params);
    QCborArray items;
    for (const core::Variant& item : dispatcher.enumerate(object))
        items.append(codec.encode(item));
    QCborMap result;
    result.insert(QStringLiteral("items"), items);
    return result;
}

QCborValue Server::Private::connect(const QCborMap& params)
{
    HandleTable::Handle handle = 0;
    const core::ObjectPtr object = requireObject(params, &handle);
    const ClassDescription* description = registry.describe(*object);
    core::EventSource* source = description && !description->eventInterfaceName.isEmpty()
        ? description->eventSource(*object)
        : nullptr;
    if (!source)
        throw RpcError { Code::InvalidParams,
            QStringLiteral("Objects of class %1 raise no events").arg(object->className()) };
    const std::optional<std::vector<int32_t>> events
        = subscribedEvents(*description, params.value(QStringLiteral("events")));
    if (const auto found = connections.find(handle); found != connections.end()) {
        // Connecting again without a list keeps what the host has; with one, the host names
        // the events it handles now.
        if (!events)
            return QCborMap();
        disconnect(handle);
    }
    const int cookie = source->connect(
        [this, handle](int32_t dispid, const QString& name, std::span<core::Variant> args) {
            raiseEvent(handle, dispid, name, args);
        },
        events);
    connections[handle] = Connection { source, cookie };
    return QCborMap();
}

std::optional<std::vector<int32_t>> Server::Private::subscribedEvents(
    const ClassDescription& description, const QCborValue& names)
{
    if (names.isUndefined() || names.isNull())
        return std::nullopt;
    if (!names.isArray())
        throw RpcError { Code::InvalidParams, str("events must be a list of event names") };
    std::vector<int32_t> dispids;
    for (const QCborValue& name : names.toArray()) {
        const auto event = std::find_if(description.events.begin(), description.events.end(),
            [&name](const EventDescription& e) {
                return name.isString() && e.name.compare(name.toString(), Qt::CaseInsensitive) == 0;
            });
        if (event == description.events.end())
            throw RpcError { Code::InvalidParams,
                QStringLiteral("%1 raises no event %2")
                    .arg(description.name, name.isString() ? name.toString() : str("?")) };
        dispids.push_back(event->dispid);
    }
    return dispids;
}

void Server::Private::disconnect(HandleTable::Handle handle)
{
    const auto found = connections.find(handle);
    if (found == connections.end())
        return;
    const Connection connection = found->second;
    connections.erase(found);
    connection.source->disconnect(connection.cookie);
}

QCborValue Server::Private::release(const QCborMap& params)
{
    const QCborValue handle = params.value(QStringLiteral("object"));
    if (!handle.isInteger() || !handles.release(handle.toInteger())) {
        const QString message = QStringLiteral("Unknown object handle %1").arg(handle.toInteger());
        QCborMap data;
        data.insert(QStringLiteral("description"), message);
        throw RpcError { Code::InvalidParams, message, data };
    }
    return QCborMap();
}

void Server::Private::raiseEvent(
    HandleTable::Handle handle, int32_t dispid, const QString& name, std::span<core::Variant> args)
{
    // This runs inside the component's code: nothing may escape from here.
    try {
        if (channel.isStopped())
            return;
        if (nesting >= maxNesting) {
            qCWarning(lcServer) << "event" << name << "not raised: events nested too deep";
            return;
        }
        const qint64 id = nextEventId++;
        QCborArray encoded;
        for (const core::Variant& arg : args)
            encoded.append(codec.encode(arg));
        QCborMap params;
        params.insert(QStringLiteral("object"), handle);
        params.insert(QStringLiteral("name"), name);
        params.insert(QStringLiteral("dispid"), dispid);
        params.insert(QStringLiteral("args"), encoded);
        QCborMap request;
        request.insert(QStringLiteral("jsonrpc"), QStringLiteral("2.0"));
        request.insert(QStringLiteral("id"), id);
        request.insert(QStringLiteral("method"), QStringLiteral("event"));
        request.insert(QStringLiteral("params"), params);
        send(request);
        const std::optional<QCborMap> response = waitForResponse(id);
        if (response && response->contains(QStringLiteral("result")))
            applyEventResult(handle, dispid, response->value(QStringLiteral("result")), args);
    } catch (const std::exception& error) {
        qCWarning(lcServer) << "event" << name << "failed:" << error.what();
    }
}

void Server::Private::applyEventResult(HandleTable::Handle handle, int32_t dispid,
    const QCborValue& result, std::span<core::Variant> args)
{
    const QCborArray answered = result.toMap().value(QStringLiteral("args")).toArray();
    const core::ObjectPtr source = handles.object(handle);
    const ClassDescription* description = source ? registry.describe(*source) : nullptr;
    const EventDescription* event = description ? description->event(dispid) : nullptr;
    for (size_t i = 0; i < args.size() && qsizetype(i) < answered.size(); ++i) {
        const ParamDescription* param
            = event && i < event->params.size() ? &event->params[i] : nullptr;
        if (param && !param->byRef)
            continue;
        try {
            const core::Variant value = codec.decode(answered.at(qsizetype(i)));
            args[i] = param ? dispatcher.coerce(value, param->type) : value;
        } catch (const std::exception& error) {
            // The host's handler answered something the argument cannot take; the argument
            // keeps its value, as when the handler leaves it alone.
            qCWarning(lcServer) << "event argument" << i << "kept:" << error.what();
        }
    }
}

std::optional<QCborMap> Server::Private::waitForResponse(qint64 id)
{
    waitingFor.insert(id);
    ++nesting;
    std::optional<QCborMap> answer;
    while (true) {
        if (const auto early = earlyAnswers.find(id); early != earlyAnswers.end()) {
            answer = std::move(early->second);
            earlyAnswers.erase(early);
            break;
        }
        const std::optional<LineChannel::Line> line = channel.readLine();
        if (!line)
            break;
        const std::optional<QCborMap> message = parse(*line);
        if (!message)
            continue;
        if (!isResponse(*message)) {
            handleRequest(*message);
            continue;
        }
        const QCborValue answerId = message->value(QStringLiteral("id"));
        if (answerId.isInteger() && answerId.toInteger() == id) {
            answer = *message;
            break;
        }
        if (answerId.isInteger() && waitingFor.contains(answerId.toInteger()))
            earlyAnswers[answerId.toInteger()] = *message;
        else
            qCWarning(lcServer) << "answer to no event:" << JsonText::serialize(*message);
    }
    --nesting;
    waitingFor.erase(id);
    return answer;
}

void Server::Private::send(const QCborMap& message)
{
    channel.writeLine(JsonText::serialize(message));
}

void Server::Private::reply(const QCborValue& id, const QCborValue& result)
{
    QCborMap message;
    message.insert(QStringLiteral("jsonrpc"), QStringLiteral("2.0"));
    message.insert(QStringLiteral("id"), id);
    message.insert(QStringLiteral("result"), result);
    send(message);
}

void Server::Private::replyError(
    const QCborValue& id, int code, const QString& text, const QCborValue& data)
{
    QCborMap error;
    error.insert(QStringLiteral("code"), code);
    error.insert(QStringLiteral("message"), text);
    if (!data.isUndefined())
        error.insert(QStringLiteral("data"), data);
    QCborMap message;
    message.insert(QStringLiteral("jsonrpc"), QStringLiteral("2.0"));
    message.insert(QStringLiteral("id"), id);
    message.insert(QStringLiteral("error"), error);
    send(message);
}

Server::Server(int input, int output, const Registry& registry)
    : d(std::make_unique<Private>(input, output, registry))
{ }

Server::~Server() = default;

int Server::run()
{
    return d->run();
}

size_t Server::heldObjects() const
{
    return d->handles.size();
}

void Server::setInputEndedHandler(std::function<void()> handler)
{
    QObject::connect(&d->channel, &LineChannel::inputEnded, std::move(handler));
}

} // namespace automation
