// How this engine's script reaches the program: the only place that knows the difference between the engines.
//   native.call(name, request)             the program's answer
//   native.callAsync(name, request, done)  done(answer) later
//   native.isThere                         false when the page is open in anything but the support tool
"use strict";

var native = (function () {
  var later = typeof Window !== "undefined" && Window.this && typeof Window.this.xcall === "function";
  var earlier = !later && typeof view !== "undefined" && view !== null;

  function pass(name, args) {
    if (later) return Window.this.xcall.apply(Window.this, [name].concat(args));
    if (earlier) return view[name].apply(view, args);
    return {};
  }

  return {
    isThere: Boolean(later || earlier),
    call: function (name, request) {
      return pass(name, request === undefined ? [] : [request]) || {};
    },
    callAsync: function (name, request, done) {
      pass(name, [request === undefined ? null : request, done]);
    }
  };
})();
