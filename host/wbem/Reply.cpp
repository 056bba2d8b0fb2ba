#include "host/wbem/Reply.h"

#include "host/wbem/CimFields.h"
#include "host/wbem/FieldText.h"

namespace marlo::wbem {

namespace {

void begin(cimxml::Writer& writer, const ReplyHead& head) {
    if (head.intrinsic) {
        writer.beginIntrinsic(head.messageId, head.method);
    } else {
        writer.beginExtrinsic(head.messageId, head.method);
    }
}

void end(cimxml::Writer& writer, const ReplyHead& head) {
    if (head.intrinsic) {
        writer.endIntrinsic();
    } else {
        writer.endExtrinsic();
    }
    writer.finish();
}

http::Fields answerFields(const ReplyHead& head) {
    http::Fields fields{{"Content-Type", head.type + "; charset=utf-8"}, {"Cache-Control", "no-cache"}};
    if (head.prefix) {
        const std::string number = head.prefix->substr(0, head.prefix->size() - 1);
        fields.push_back({"Ext", ""});
        fields.push_back({"Man", std::string(extensionUri) + "; ns=" + number});
    }
    fields.push_back({head.prefix.value_or("") + "CIMOperation", "MethodResponse"});
    return fields;
}

} // namespace

Reply::Reply(http::Responder& responder, ReplyHead head) : _responder(responder), _head(std::move(head)) {}

void Reply::hand(std::string_view piece) {
    if (!_begun) {
        _begun = true;
        http::Fields fields = answerFields(_head);
        if (_head.trailers) {
            fields.push_back({"Trailer", "CIMStatusCode, CIMStatusCodeDescription"});
        }
        _responder.begin(200, std::move(fields));
    }
    _bytes += piece.size();
    _responder.write(piece);
}

void Reply::open() {
    if (_state == State::untouched) {
        _writer = std::make_unique<cimxml::Writer>([this](std::string_view piece) { hand(piece); }, _head.host);
        begin(*_writer, _head);
        _state = State::opened;
    }
}

cimxml::Writer& Reply::returned() {
    if (_state != State::returning) {
        open();
        _writer->beginReturnValue();
        _state = State::returning;
    }
    return *_writer;
}

cimxml::Writer& Reply::behind() {
    open();
    if (_state == State::returning) {
        _writer->endReturnValue();
    }
    _state = State::behind;
    return *_writer;
}

void Reply::succeed() {
    if (_state != State::ended) {
        end(behind(), _head);
        _state = State::ended;
        _responder.finish();
    }
}

std::string Reply::errorDocument(unsigned code, const std::string& description) const {
    std::string document;
    cimxml::Writer writer([&document](std::string_view piece) { document += piece; }, _head.host);
    begin(writer, _head);
    writer.error(code, description);
    end(writer, _head);
    return document;
}

void Reply::fail(unsigned code, const std::string& description) {
    if (_state == State::ended) {
        return;
    }
    _state = State::ended;
    http::Answer answer;
    answer.fields = answerFields(_head);
    answer.body = errorDocument(code, description);
    const std::size_t size = answer.body.size();
    if (_begun) {
        _responder.fail(std::move(answer), {{"CIMStatusCode", std::to_string(code)},
                                            {"CIMStatusCodeDescription", percentEncoded(description)}});
    } else {
        _responder.send(std::move(answer));
    }
    _bytes += size;
}

} // namespace marlo::wbem
