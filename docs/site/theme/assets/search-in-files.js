// Lets the search of the theme work when the pages are opened as files, where browsers permit neither workers nor
// requests: the index comes from a script, and the worker's script runs in a hidden frame.
if (location.protocol === "file:") {
  document.write('<script src="' + document.currentScript.dataset.index + '"><\/script>');

  window.Worker = class extends EventTarget {
    constructor(url) {
      super();
      const frame = document.createElement("iframe");
      frame.hidden = true;
      document.body.append(frame);
      this.inside = frame.contentWindow;
      this.inside.postMessage = (data) => this.dispatchEvent(new MessageEvent("message", { data }));
      const script = frame.contentDocument.createElement("script");
      this.isLoaded = new Promise((resolve) => (script.onload = resolve));
      script.src = new URL(url, location).href;
      frame.contentDocument.body.append(script);
    }
    postMessage(data) {
      this.isLoaded.then(() => this.inside.dispatchEvent(new this.inside.MessageEvent("message", { data })));
    }
    terminate() {}
  };
}
